// Every platform call of a whole backup, wipe, restore and sync fails once: nothing breaks, and doing it again makes
// good what was missed.
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

  /// All of it with a failure of the `number`-th call, and again from where it may have gone wrong.
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
    expectInOrder(whole.device());
    whole.giveUpWhatHangs();
    if (!isRestored) whole.restore();
    whole.sync();
    expectInOrder(whole.device());
    EXPECT_EQ(whole.apps(), WholeRestore::everyAppButTheUnreadable());
    EXPECT_EQ(whole.filesFiledAway(), whole.filesLeft());
    if (extent == Extent::once) {
      EXPECT_TRUE(whole.device().coordination.abandoned().empty()) << "something is neither attached nor cancelled";
    }
  }
};

TEST_P(RestoreFault, WhicheverCallFailsTheRestoredDeviceIsTheSameInTheEnd) {
  const std::size_t count = calls(std::get<Mode>(GetParam())).size();
  EXPECT_GT(count, 200U) << "the restore has lost most of what it did";
  RecordProperty("calls", static_cast<int>(count));
  std::cout << "platform calls: " << count << '\n';
  for (std::size_t number = 1; number <= count; ++number)
    runWithinPatience(number, [number] { restoreWithFault(number); });
}

TEST_P(RestoreFault, TheCallsComeInTheSameOrderInEveryRun) {
  const Mode mode = std::get<Mode>(GetParam());
  EXPECT_EQ(calls(mode), calls(mode));
}

TEST_P(RestoreFault, UndisturbedOneRestoreAndOneSyncBringEveryAppBack) {
  WholeRestore whole(std::get<Mode>(GetParam()));
  runAll(whole);
  EXPECT_EQ(whole.apps(), WholeRestore::everyAppButTheUnreadable());
  EXPECT_EQ(whole.filesFiledAway(), 1U);
  EXPECT_EQ(whole.device().time.now(), TimePoint()) << "who waits for placeholders does so until the last one";
}

INSTANTIATE_TEST_SUITE_P(Modes, RestoreFault,
                         testing::Combine(testing::Values(Mode::direct, Mode::coordinated),
                                          testing::Values(Extent::once, Extent::fromThenOn)),
                         nameOf);

}  // namespace
}  // namespace appsync::test
