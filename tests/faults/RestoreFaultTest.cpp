// Fails each platform call of a backup, wipe, restore and sync once: all invariants hold, and a repetition completes
// the restore.
#include <cstddef>
#include <iostream>
#include <optional>
#include <string>
#include <string_view>
#include <tuple>
#include <vector>

#include <gtest/gtest.h>

#include "tests/faults/Faults.h"
#include "tests/faults/WholeRestore.h"

namespace appsync::test {
namespace {

using Conditions = std::tuple<Mode, Extent>;

std::string nameOf(const testing::TestParamInfo<Conditions>& info) {
  const auto& [mode, extent] = info.param;
  return std::string(mode == Mode::coordinated ? "Coordinated" : "Direct") +
         (extent == Extent::once ? "Once" : "FromThenOn");
}

class RestoreFault : public testing::TestWithParam<Conditions> {
 protected:
  static void runAll(WholeRestore& whole) {
    whole.backUp();
    whole.wipe();
    whole.restore();
    whole.sync();
    whole.setHook(nullptr);
  }

  static std::vector<std::string> calls(Mode mode) {
    std::vector<std::string> calls;
    WholeRestore whole(mode);
    whole.setHook([&calls](std::string_view operation, std::string_view arguments) -> std::optional<Error> {
      calls.push_back(std::string(operation) + " " + std::string(arguments));
      return std::nullopt;
    });
    runAll(whole);
    return calls;
  }

  /// Runs all steps with a failure of the `number`-th call, then repeats them from the step that may have failed.
  static void restoreWithFault(std::size_t number) {
    const auto& [mode, extent] = GetParam();
    const Fault fault(number, extent);
    WholeRestore whole(mode);
    whole.setHook(fault.hook());
    whole.backUp();
    whole.wipe();
    whole.restore();
    const bool isRestored = !fault.hasHappened();
    whole.sync();
    whole.setHook(nullptr);
    SCOPED_TRACE("call " + std::to_string(number) + ": " + fault.call());
    EXPECT_TRUE(fault.hasHappened());
    expectNothingPending(whole.device());
    whole.cancelStalledInstalls();
    if (!isRestored) whole.restore();
    whole.sync();
    expectNothingPending(whole.device());
    EXPECT_EQ(whole.apps(), WholeRestore::readableApps());
    EXPECT_EQ(whole.archivedFiles(), whole.writtenFiles());
    if (extent == Extent::once) {
      EXPECT_TRUE(whole.device().coordination.abandoned().empty())
          << "a promise or placeholder is neither attached nor cancelled";
    }
  }
};

TEST_P(RestoreFault, RestoreAfterAnyFailedCallReachesTheSameState) {
  const std::size_t count = calls(std::get<Mode>(GetParam())).size();
  EXPECT_GT(count, 200U) << "the restore makes fewer calls than expected";
  RecordProperty("calls", static_cast<int>(count));
  std::cout << "platform calls: " << count << '\n';
  for (std::size_t number = 1; number <= count; ++number)
    runWithTimeout(number, [number] { restoreWithFault(number); });
}

TEST_P(RestoreFault, OrderOfCallsIsTheSameInEveryRun) {
  const Mode mode = std::get<Mode>(GetParam());
  EXPECT_EQ(calls(mode), calls(mode));
}

TEST_P(RestoreFault, RestoreAndSyncBringBackEveryApp) {
  WholeRestore whole(std::get<Mode>(GetParam()));
  runAll(whole);
  EXPECT_EQ(whole.apps(), WholeRestore::readableApps());
  EXPECT_EQ(whole.archivedFiles(), 1U);
  EXPECT_EQ(whole.device().time.now(), TimePoint()) << "the wait for placeholders must end with the last one";
}

INSTANTIATE_TEST_SUITE_P(Modes, RestoreFault,
                         testing::Combine(testing::Values(Mode::direct, Mode::coordinated),
                                          testing::Values(Extent::once, Extent::fromThenOn)),
                         nameOf);

}  // namespace
}  // namespace appsync::test
