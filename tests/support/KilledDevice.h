// Processes that are killed at each fault point of their work on a device.
#pragma once

#include <chrono>
#include <csignal>
#include <cstdlib>
#include <functional>
#include <string>
#include <string_view>

#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include "tests/support/TestDevice.h"

namespace appsync::test {

/// Runs `work` in a child process that is killed before its step number `step`. Returns false if it has fewer steps.
inline bool killedAt(long step, const std::function<void()>& work) {
  const pid_t child = fork();
  if (child == 0) {
    setenv("APPSYNC_KILL_AT", std::to_string(step).c_str(), 1);
    work();
    _exit(0);
  }
  int status = 0;
  EXPECT_EQ(waitpid(child, &status, 0), child);
  if (WIFSIGNALED(status)) {
    EXPECT_EQ(WTERMSIG(status), SIGKILL);
    return true;
  }
  EXPECT_EQ(WEXITSTATUS(status), 0);
  return false;
}

/// Returns the number of containers in the records. Expects each record's bundle to exist.
inline std::ptrdiff_t containersOfRecords(TestDevice& device) {
  std::ptrdiff_t containers = 0;
  const auto apps = device.registry().apps();
  EXPECT_TRUE(apps.ok());
  for (const auto& app : *apps) {
    EXPECT_TRUE(device.files().fileExists(*app->bundlePath() + "/Info.plist")) << app->description();
    containers += (app->isInstalled() ? 1 : 0) + (app->isPlaceholder() ? 1 : 0);
  }
  return containers;
}

/// Returns "1.0", "1.0 placeholder" for an app with a placeholder, or "none".
inline std::string versionOf(TestDevice& device, std::string_view identifier) {
  const auto app = device.record(identifier);
  return app == nullptr ? "none"
                        : app->bundleVersion().value_or("no version") + (app->isPlaceholder() ? " placeholder" : "");
}

/// Kills opening a device and `work` at each step, each time on a device from `prepare`, and calls `check` on the
/// result.
inline void killAtEveryStep(const std::function<void(TestDevice&)>& prepare,
                            const std::function<void(TestDevice&)>& work, const std::function<void(TestDevice&)>& check,
                            device::InstallMode mode = device::InstallMode::direct) {
  TestDevice original(mode);
  prepare(original);
  original.close();
  long step = 1;
  for (bool goOn = true; goOn; ++step) {
    TestDevice device(original.path());
    goOn = killedAt(step, [&] {
      device.reopen();
      work(device);
    });
    device.reopen();
    ASSERT_TRUE(device.services().installCoordination().waitUntilIdle(std::chrono::minutes(5)));
    EXPECT_TRUE(device.isTidy()) << "step " << step;
    EXPECT_EQ(containersOfRecords(device), device.containers()) << "step " << step;
    check(device);
    if (testing::Test::HasFailure()) {
      FAIL() << "killed at step " << step;
    }
  }
  EXPECT_GT(step, 10) << "that is too few steps to be all of them";
}

}  // namespace appsync::test
