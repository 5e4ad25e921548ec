// Bounded waits: a test that would hang ends with a message instead.
#pragma once

#include <chrono>
#include <condition_variable>
#include <future>
#include <mutex>
#include <string_view>

namespace appsync::test {

/// The longest wait for another thread; the end of a test that would hang, never a pace.
inline constexpr std::chrono::seconds kPatience{30};

/// Writes that the running test hangs, and where, then aborts the process: the threads that hang could not be joined.
[[noreturn]] void endHangingTest(std::string_view where);

/// Blocks until `isReady`; ends the process when that takes longer than `limit`.
template <class Ready>
void awaitReady(std::condition_variable& changed, std::unique_lock<std::mutex>& lock, const Ready& isReady,
                std::string_view where, std::chrono::seconds limit = kPatience) {
  if (!changed.wait_for(lock, limit, isReady)) endHangingTest(where);
}

/// The same for a future, whose value is the caller's to get.
template <class Future>
void awaitReady(const Future& future, std::string_view where, std::chrono::seconds limit = kPatience) {
  if (future.wait_for(limit) != std::future_status::ready) endHangingTest(where);
}

}  // namespace appsync::test
