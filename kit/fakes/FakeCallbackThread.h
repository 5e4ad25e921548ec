// The thread on which a fake service calls back.
#pragma once

#include <condition_variable>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <mutex>
#include <set>
#include <thread>

#include "base/OperationQueue.h"

namespace appsync::test {

/// Calls subscribers back one call at a time, never on the thread that asks for it. Threads: any.
class FakeCallbackThread {
 public:
  using Subscription = std::uint64_t;

  [[nodiscard]] Subscription subscribe();

  /// When this returns none of the subscription's callbacks runs on another thread and none will begin.
  void unsubscribe(Subscription subscription);

  /// Runs `callback` soon, unless the subscription has ended by then.
  void post(Subscription subscription, std::function<void()> callback);

  /// Blocks until everything that was posted has run or was dropped.
  void waitUntilIdle();

  [[nodiscard]] std::size_t subscriptions() const;

 private:
  void run(Subscription subscription, const std::function<void()>& callback);

  mutable std::mutex mutex_;
  std::condition_variable changed_;
  std::set<Subscription> subscriptions_;
  Subscription last_ = 0;
  std::size_t pending_ = 0;
  /// Whose callback is running, 0 for nobody's, and where.
  Subscription running_ = 0;
  std::thread::id runner_;
  OperationQueue queue_{1};
};

}  // namespace appsync::test
