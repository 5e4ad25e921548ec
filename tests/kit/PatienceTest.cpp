// Waits that end instead of hanging.
#include <condition_variable>
#include <future>
#include <mutex>

#include <gtest/gtest.h>

#include "kit/fakes/Patience.h"

namespace appsync::test {
namespace {

using std::chrono_literals::operator""s;

TEST(Patience, ReturnsWhenReady) {
  std::promise<int> promise;
  promise.set_value(7);
  std::future<int> future = promise.get_future();
  awaitReady(future, "a future");
  EXPECT_EQ(future.get(), 7);
  std::mutex mutex;
  std::condition_variable changed;
  std::unique_lock lock(mutex);
  awaitReady(
      changed, lock, [] { return true; }, "a condition");
}

TEST(Patience, EndsTestThatHangs) {
  std::promise<void> promise;
  const std::future<void> future = promise.get_future();
  EXPECT_DEATH(awaitReady(future, "a future", 0s), "the test hangs: a future");
  std::mutex mutex;
  std::condition_variable changed;
  std::unique_lock lock(mutex);
  EXPECT_DEATH(awaitReady(
                   changed, lock, [] { return false; }, "a condition", 0s),
               "the test hangs: a condition");
}

}  // namespace
}  // namespace appsync::test
