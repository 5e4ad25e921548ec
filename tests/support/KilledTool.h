// Runs of the tool that are killed at each step of their work.
#pragma once

#include <csignal>
#include <cstdlib>
#include <functional>
#include <string>

#include <gtest/gtest.h>

#include "tests/support/ToolRun.h"

namespace appsync::test {

/// Calls `prepare`, `work` and `check` repeatedly, with `work` killed before each `stride`-th step, or before every
/// step if APPSYNC_EVERY_STEP is in the environment, until `work` completes. Expects it to have more than `least`
/// steps.
inline void killAtEachStep(long stride, long least, const std::function<void()>& prepare,
                           const std::function<Finished(const ToolOptions&)>& work,
                           const std::function<void()>& check) {
  constexpr long kMaximum = 3000;
  if (std::getenv("APPSYNC_EVERY_STEP") != nullptr) stride = 1;
  long step = 1;
  for (; step < kMaximum; step += stride) {
    SCOPED_TRACE("step " + std::to_string(step));
    prepare();
    const Finished killed = work(killedAt(step));
    if (killed.status == 0) break;
    ASSERT_EQ(killed.status, -SIGKILL) << killed.err;
    check();
    if (testing::Test::HasFailure()) return;
  }
  EXPECT_GT(step, least);
  EXPECT_LT(step, kMaximum);
}

}  // namespace appsync::test
