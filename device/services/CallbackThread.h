// The thread on which a service calls its observers.
#pragma once

#include <condition_variable>
#include <deque>
#include <functional>
#include <mutex>
#include <thread>

namespace appsync::device {

/// Runs callbacks one at a time, in the order of `post`, without holding a lock. The first `post` starts the thread;
/// the destructor stops it. Thread-safe; callable from callbacks unless documented otherwise.
class CallbackThread {
 public:
  CallbackThread() = default;
  ~CallbackThread();
  CallbackThread(const CallbackThread&) = delete;
  CallbackThread& operator=(const CallbackThread&) = delete;

  /// Queues a callback for `receiver`, which identifies it and is never dereferenced. Must not be null.
  void post(const void* receiver, std::function<void()> callback);

  /// Drops the queued callbacks of `receiver` and blocks until its running callback has returned, unless called on the
  /// callback thread. Afterwards none runs until the next `post` for it.
  void forget(const void* receiver);

  /// Drops all queued and future callbacks and blocks until the running one has returned. Must not be called on the
  /// callback thread unless already stopped.
  void stop();

 private:
  struct Callback {
    const void* receiver;
    std::function<void()> function;
  };

  void run();

  std::mutex mutex_;
  std::condition_variable changed_;
  std::deque<Callback> queued_;
  /// The receiver of the running callback, or null.
  const void* running_ = nullptr;
  bool stopping_ = false;
  std::thread thread_;
};

}  // namespace appsync::device
