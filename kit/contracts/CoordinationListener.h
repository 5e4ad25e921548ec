// Records the callbacks of an install-coordination service.
#pragma once

#include <atomic>
#include <functional>
#include <mutex>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "platform/InstallObserver.h"

namespace appsync::test {

/// Records callbacks as texts: "placeholder com.a", "complete com.a", "prioritize com.a", "cancelled com.a by 2 for
/// ZTError 30". The first two end in " with error" if the coordinator has an error. Fails the test if callbacks
/// overlap. Thread-safe.
class CoordinationListener final : public platform::InstallObserverDelegate {
 public:
  /// `inCallback` runs in each callback.
  explicit CoordinationListener(std::function<void(platform::InstallCoordinator&)> inCallback = nullptr)
      : inCallback_(std::move(inCallback)) {}

  [[nodiscard]] std::vector<std::string> events();
  /// Returns how many times `line` was recorded.
  [[nodiscard]] std::size_t count(const std::string& line);
  /// The thread of the latest callback.
  [[nodiscard]] std::thread::id thread() const { return thread_; }

  void coordinatorDidInstallPlaceholder(platform::InstallCoordinator& coordinator) override;
  void coordinatorDidCompleteSuccessfully(platform::InstallCoordinator& coordinator) override;
  void coordinatorShouldPrioritize(platform::InstallCoordinator& coordinator) override;
  void coordinatorCanceledWithReason(platform::InstallCoordinator& coordinator, const Error& reason,
                                     platform::ClientIdentity client) override;

 private:
  void note(std::string line, platform::InstallCoordinator& coordinator);

  const std::function<void(platform::InstallCoordinator&)> inCallback_;
  std::atomic<int> inside_ = 0;
  std::atomic<std::thread::id> thread_;
  std::mutex mutex_;
  std::vector<std::string> events_;
};

}  // namespace appsync::test
