// A thread of a service's own, on which observers are called back.
#pragma once

#include <condition_variable>
#include <deque>
#include <functional>
#include <mutex>
#include <thread>

namespace appsync::device {

/// Delivers callbacks one at a time, in the order of `post`, with no lock held. The thread starts with the first one.
///
/// Every operation may be called on any thread, from callbacks too, unless it says otherwise. Destruction stops it.
class CallbackThread {
 public:
  CallbackThread() = default;
  ~CallbackThread();
  CallbackThread(const CallbackThread&) = delete;
  CallbackThread& operator=(const CallbackThread&) = delete;

  /// Queues a callback to `receiver`, which is compared only, never followed, and not null.
  void post(const void* receiver, std::function<void()> callback);

  /// Drops what is queued for `receiver`. When this returns no callback to it runs on another thread and, until the
  /// next `post` for it, none will begin; on the callback thread itself it does not wait.
  void forget(const void* receiver);

  /// Drops what is queued, and all that is posted from now on, and returns when the running callback has. Not on the
  /// callback thread itself, unless it has been stopped before.
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
  /// Whose callback runs now; null when none does.
  const void* running_ = nullptr;
  bool stopping_ = false;
  std::thread thread_;
};

}  // namespace appsync::device
