// The registry's record of how far one app's install is.
#pragma once

#include <cstdint>
#include <string>

#include "platform/InstallTypes.h"

namespace appsync::platform {

/// How far an install is, as the home screen shows it. Live: a change is seen by everyone who holds a record of the
/// same app, and `completedUnitCount / totalUnitCount` is what a person sees.
///
/// Shared ownership (the registry hands out shared pointers); it may outlive the install, and setters are then without
/// effect. Threads: any, at any time. Nothing fails.
class InstallProgress {
 public:
  virtual ~InstallProgress() = default;

  [[nodiscard]] virtual TSInstallState installState() const = 0;
  virtual void setInstallState(TSInstallState state) = 0;

  [[nodiscard]] virtual TSInstallPhase installPhase() const = 0;
  virtual void setInstallPhase(TSInstallPhase phase) = 0;

  /// Units in the whole of the current phase. A new record's count is the registry's choice.
  [[nodiscard]] virtual std::int64_t totalUnitCount() const = 0;
  virtual void setTotalUnitCount(std::int64_t units) = 0;

  [[nodiscard]] virtual std::int64_t completedUnitCount() const = 0;
  virtual void setCompletedUnitCount(std::int64_t units) = 0;

  /// Gives the install up: its state becomes Canceled, and observers of the registry hear of it.
  virtual void cancel() = 0;

  /// For logs.
  [[nodiscard]] virtual std::string description() const = 0;
};

}  // namespace appsync::platform
