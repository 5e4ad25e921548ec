#include "device/services/CallbackThread.h"

#include <utility>

namespace appsync::device {

CallbackThread::~CallbackThread() {
  stop();
}

void CallbackThread::stop() {
  std::deque<Callback> dropped;
  {
    const std::lock_guard lock(mutex_);
    stopping_ = true;
    dropped.swap(queued_);
  }
  changed_.notify_all();
  if (thread_.joinable()) thread_.join();
}

void CallbackThread::post(const void* receiver, std::function<void()> callback) {
  {
    const std::lock_guard lock(mutex_);
    if (stopping_) return;
    queued_.push_back({receiver, std::move(callback)});
    if (!thread_.joinable()) thread_ = std::thread([this] { run(); });
  }
  changed_.notify_all();
}

void CallbackThread::forget(const void* receiver) {
  std::deque<Callback> dropped;  // Destroys the captured objects without the lock.
  std::unique_lock lock(mutex_);
  for (Callback& callback : std::exchange(queued_, {})) {
    (callback.receiver == receiver ? dropped : queued_).push_back(std::move(callback));
  }
  if (thread_.get_id() == std::this_thread::get_id()) return;
  changed_.wait(lock, [&] { return running_ != receiver; });
}

void CallbackThread::run() {
  std::unique_lock lock(mutex_);
  for (;;) {
    changed_.wait(lock, [this] { return stopping_ || !queued_.empty(); });
    if (stopping_) return;
    Callback callback = std::move(queued_.front());
    queued_.pop_front();
    running_ = callback.receiver;
    lock.unlock();
    callback.function();
    callback.function = nullptr;
    lock.lock();
    running_ = nullptr;
    changed_.notify_all();
  }
}

}  // namespace appsync::device
