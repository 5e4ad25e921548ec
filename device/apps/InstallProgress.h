// The live progress of an install.
#pragma once

#include <cstdint>
#include <functional>
#include <mutex>
#include <string>

#include "device/apps/AppTable.h"
#include "platform/InstallProgress.h"

namespace appsync::device {

/// Setters have no effect after the end of the install. Thread-safe.
class InstallProgress final : public platform::InstallProgress {
 public:
  enum class Change : std::uint8_t { units, course, cancelled };
  /// Called after each change, on the calling thread of the setter and without a lock.
  using Listener = std::function<void(InstallProgress& progress, Change change)>;

  InstallProgress(std::string identifier, ProgressValues values, Listener listener)
      : identifier_(std::move(identifier)), listener_(std::move(listener)), values_(values) {}

  /// Creates the progress of an ended install, for readers of the device.
  InstallProgress(std::string identifier, ProgressValues values)
      : identifier_(std::move(identifier)), values_(values), ended_(true) {}

  [[nodiscard]] platform::TSInstallState installState() const override { return values().state; }
  void setInstallState(platform::TSInstallState state) override;
  [[nodiscard]] platform::TSInstallPhase installPhase() const override { return values().phase; }
  void setInstallPhase(platform::TSInstallPhase phase) override;
  [[nodiscard]] std::int64_t totalUnitCount() const override { return values().totalUnits; }
  void setTotalUnitCount(std::int64_t units) override;
  [[nodiscard]] std::int64_t completedUnitCount() const override { return values().completedUnits; }
  void setCompletedUnitCount(std::int64_t units) override;
  /// Ends the install in state Canceled. Does nothing once the state is Canceled or beyond.
  void cancel() override;
  /// "com.example.notes: TSInstallState 1, TSInstallPhase 0, 250 of 1000"
  [[nodiscard]] std::string description() const override;

  [[nodiscard]] const std::string& identifier() const noexcept { return identifier_; }
  [[nodiscard]] ProgressValues values() const;
  [[nodiscard]] bool ended() const;

  /// Sets all values at once.
  void set(const ProgressValues& values);
  /// Ends the install in this state without calling the listener.
  void end(platform::TSInstallState state);

 private:
  /// Changes a value and calls the listener, unless the install has ended or the value is the same.
  template <class T>
  void change(T ProgressValues::*field, T value, Change kind);

  const std::string identifier_;
  const Listener listener_;
  mutable std::mutex mutex_;
  ProgressValues values_;
  bool ended_ = false;
};

}  // namespace appsync::device
