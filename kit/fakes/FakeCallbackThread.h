// The thread on which a fake service runs callbacks.
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

/// Runs callbacks to subscribers one at a time, never on the posting thread. Thread-safe.
class FakeCallbackThread {
 public:
  using Subscription = std::uint64_t;

  [[nodiscard]] Subscription subscribe();

  /// Ends the subscription: blocks until its running callback has returned, unless called from that callback; no
  /// further callback begins.
  void unsubscribe(Subscription subscription);

  /// Runs `callback` asynchronously, unless the subscription ends first.
  void post(Subscription subscription, std::function<void()> callback);

  /// Blocks until every posted callback has run or was discarded.
  void waitUntilIdle();

  [[nodiscard]] std::size_t subscriptions() const;

 private:
  void run(Subscription subscription, const std::function<void()>& callback);

  mutable std::mutex mutex_;
  std::condition_variable changed_;
  std::set<Subscription> subscriptions_;
  Subscription last_ = 0;
  std::size_t pending_ = 0;
  /// Subscription of the running callback, or 0, and the thread on which it runs.
  Subscription running_ = 0;
  std::thread::id runner_;
  OperationQueue queue_{1};
};

}  // namespace appsync::test
