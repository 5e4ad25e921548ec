#include "kit/fakes/FakeCallbackThread.h"

#include <utility>

#include "kit/fakes/Patience.h"

namespace appsync::test {

FakeCallbackThread::Subscription FakeCallbackThread::subscribe() {
  const std::scoped_lock lock(mutex_);
  subscriptions_.insert(++last_);
  return last_;
}

void FakeCallbackThread::unsubscribe(Subscription subscription) {
  std::unique_lock lock(mutex_);
  subscriptions_.erase(subscription);
  if (running_ == subscription && runner_ == std::this_thread::get_id()) return;
  awaitReady(
      changed_, lock, [&] { return running_ != subscription; }, "a callback does not return");
}

void FakeCallbackThread::post(Subscription subscription, std::function<void()> callback) {
  {
    const std::scoped_lock lock(mutex_);
    ++pending_;
  }
  queue_.add([this, subscription, callback = std::move(callback)] { run(subscription, callback); });
}

void FakeCallbackThread::run(Subscription subscription, const std::function<void()>& callback) {
  std::unique_lock lock(mutex_);
  if (subscriptions_.contains(subscription)) {
    running_ = subscription;
    runner_ = std::this_thread::get_id();
    lock.unlock();
    callback();
    lock.lock();
    running_ = 0;
  }
  --pending_;
  changed_.notify_all();
}

void FakeCallbackThread::waitUntilIdle() {
  std::unique_lock lock(mutex_);
  awaitReady(
      changed_, lock, [this] { return pending_ == 0; }, "a callback thread stays busy");
}

std::size_t FakeCallbackThread::subscriptions() const {
  const std::scoped_lock lock(mutex_);
  return subscriptions_.size();
}

}  // namespace appsync::test
