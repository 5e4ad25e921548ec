// Periodic work on a dedicated thread.
#pragma once

#include <chrono>
#include <condition_variable>
#include <functional>
#include <mutex>
#include <thread>

namespace appsync::host {

/// How often the state of the device is polled where nothing notifies of a change.
inline constexpr std::chrono::milliseconds kTimeBetweenLooks(20);

/// Calls a function on a dedicated thread, with a pause after each call. The destructor waits for a running call.
class Ticker {
 public:
  Ticker(std::chrono::milliseconds pause, std::function<void()> tick)
      : tick_(std::move(tick)), thread_([this, pause] { run(pause); }) {}
  ~Ticker() {
    {
      const std::lock_guard lock(mutex_);
      ends_ = true;
    }
    changed_.notify_all();
    thread_.join();
  }
  Ticker(const Ticker&) = delete;
  Ticker& operator=(const Ticker&) = delete;

 private:
  void run(std::chrono::milliseconds pause) {
    std::unique_lock lock(mutex_);
    while (!ends_) {
      lock.unlock();
      tick_();
      lock.lock();
      changed_.wait_for(lock, pause, [this] { return ends_; });
    }
  }

  const std::function<void()> tick_;
  std::mutex mutex_;
  std::condition_variable changed_;
  bool ends_ = false;
  std::thread thread_;
};

}  // namespace appsync::host
