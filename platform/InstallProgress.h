// Progress of one app's install.
#pragma once

#include <cstdint>
#include <string>

#include "platform/InstallTypes.h"

namespace appsync::platform {

/// Progress of an install as the home screen shows it: `completedUnitCount / totalUnitCount`. All progress objects of
/// one app share the same state.
///
/// Ownership is shared with the registry. A progress may outlive the install; its setters then have no effect.
/// Thread-safe. No operation fails.
class InstallProgress {
 public:
  virtual ~InstallProgress() = default;

  [[nodiscard]] virtual TSInstallState installState() const = 0;
  virtual void setInstallState(TSInstallState state) = 0;

  [[nodiscard]] virtual TSInstallPhase installPhase() const = 0;
  virtual void setInstallPhase(TSInstallPhase phase) = 0;

  /// Number of units of the current phase. The registry chooses the initial number.
  [[nodiscard]] virtual std::int64_t totalUnitCount() const = 0;
  virtual void setTotalUnitCount(std::int64_t units) = 0;

  [[nodiscard]] virtual std::int64_t completedUnitCount() const = 0;
  virtual void setCompletedUnitCount(std::int64_t units) = 0;

  /// Cancels the install: sets the state to Canceled and notifies the registry's observers.
  virtual void cancel() = 0;

  /// For logs.
  [[nodiscard]] virtual std::string description() const = 0;
};

}  // namespace appsync::platform
