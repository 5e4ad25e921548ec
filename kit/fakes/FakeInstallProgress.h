// Progress of one app's install; records every call.
#pragma once

#include <cstdint>
#include <functional>
#include <mutex>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "platform/InstallProgress.h"

namespace appsync::test {

/// Initially Waiting and Loading, with 0 of 100 units. Described as "progress of <identifier>". Thread-safe.
class FakeInstallProgress final : public platform::InstallProgress {
 public:
  explicit FakeInstallProgress(std::string identifier,
                               platform::TSInstallState state = platform::TSInstallState::Waiting,
                               platform::TSInstallPhase phase = platform::TSInstallPhase::Loading)
      : identifier_(std::move(identifier)), state_(state), phase_(phase) {}

  [[nodiscard]] const std::string& identifier() const { return identifier_; }

  /// Calls of setters, in order: "setInstallState 1", "setCompletedUnitCount 456", "cancel".
  [[nodiscard]] std::vector<std::string> calls() const;

  /// For the registry, which detaches before its destruction. Both are called on the setter's thread.
  struct Listener {
    /// Called by each setter; false makes the setter do nothing.
    std::function<bool(std::string_view call)> mayCall;
    /// The install was cancelled.
    std::function<void()> wasCancelled;
  };
  void attach(Listener listener);
  void detach() { attach({}); }

  /// Ends the install: setters have no effect from now on.
  void end(platform::TSInstallState lastState);
  /// Begins a phase, as the installer does.
  void enter(platform::TSInstallPhase phase);

  [[nodiscard]] platform::TSInstallState installState() const override;
  void setInstallState(platform::TSInstallState state) override;
  [[nodiscard]] platform::TSInstallPhase installPhase() const override;
  void setInstallPhase(platform::TSInstallPhase phase) override;
  [[nodiscard]] std::int64_t totalUnitCount() const override;
  void setTotalUnitCount(std::int64_t units) override;
  [[nodiscard]] std::int64_t completedUnitCount() const override;
  void setCompletedUnitCount(std::int64_t units) override;
  void cancel() override;
  [[nodiscard]] std::string description() const override { return "progress of " + identifier_; }

 private:
  /// Returns false if the setter must have no effect.
  template <class T>
  bool set(std::string call, T& field, T value);

  const std::string identifier_;
  /// Held while the listener is called, so that detaching waits for the call.
  std::recursive_mutex listenerMutex_;
  Listener listener_;
  mutable std::mutex mutex_;
  std::vector<std::string> calls_;
  platform::TSInstallState state_;
  platform::TSInstallPhase phase_;
  std::int64_t totalUnitCount_ = 100;
  std::int64_t completedUnitCount_ = 0;
  bool ended_ = false;
};

}  // namespace appsync::test
