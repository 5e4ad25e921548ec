// Hears what an install-coordination service tells, as tests want to see it.
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

/// Notes "placeholder com.a", "complete com.a", "prioritize com.a", "cancelled com.a by 2 for ZTError 30"; with " with
/// error" after it when the coordinator has one. Fails the test when two callbacks overlap. Threads: any.
class CoordinationListener final : public platform::InstallObserverDelegate {
 public:
  /// `inCallback` runs in each.
  explicit CoordinationListener(std::function<void(platform::InstallCoordinator&)> inCallback = nullptr)
      : inCallback_(std::move(inCallback)) {}

  [[nodiscard]] std::vector<std::string> heard();
  /// How often exactly this was heard.
  [[nodiscard]] std::size_t count(const std::string& line);
  /// Where the latest callback ran.
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
  std::vector<std::string> heard_;
};

}  // namespace appsync::test
