// A system that has run out of threads.
#pragma once

#include <cerrno>
#include <cstddef>
#include <functional>
#include <system_error>
#include <thread>

#include <pthread.h>

#include "base/Scheduler.h"

namespace appsync::test {

/// As long as it lives no thread can be started in this process: no stack is as large as each would have.
class NoMoreThreads {
 public:
  NoMoreThreads() {
    ::pthread_getattr_default_np(&before_);
    ::pthread_attr_t attributes;
    ::pthread_attr_init(&attributes);
    ::pthread_attr_setstacksize(&attributes, std::size_t{1} << 46);
    ::pthread_setattr_default_np(&attributes);
    ::pthread_attr_destroy(&attributes);
  }
  ~NoMoreThreads() {
    ::pthread_setattr_default_np(&before_);
    ::pthread_attr_destroy(&before_);
  }
  NoMoreThreads(const NoMoreThreads&) = delete;
  NoMoreThreads& operator=(const NoMoreThreads&) = delete;

  /// False where a sanitizer gives threads stacks of its own.
  [[nodiscard]] static bool arePossible() {
    const NoMoreThreads none;
    try {
      std::thread([] {}).join();
      return false;
    } catch (const std::system_error&) {
      return true;
    }
  }

 private:
  ::pthread_attr_t before_{};
};

/// A scheduler whose thread cannot be started.
struct ThreadlessScheduler final : Scheduler {
  void after(Duration, std::function<void()>) override { throw std::system_error(EAGAIN, std::generic_category()); }
};

}  // namespace appsync::test
