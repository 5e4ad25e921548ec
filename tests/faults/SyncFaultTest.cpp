// Fails each platform call of a sync once: all invariants hold, and the next sync completes it.
#include <cstddef>
#include <iostream>
#include <string>
#include <tuple>

#include <gtest/gtest.h>

#include "tests/faults/Faults.h"
#include "tests/faults/WholeSync.h"

namespace appsync::test {
namespace {

using Transfers = WholeSync::Transfers;

/// Whether the sync framework calls the injected failure recoverable.
enum class Judgement { unrecoverable, recoverable };
using Conditions = std::tuple<Mode, Judgement, Extent>;

std::string nameOf(const testing::TestParamInfo<Conditions>& info) {
  const auto& [mode, judgement, extent] = info.param;
  return std::string(mode == Mode::coordinated ? "Coordinated" : "Direct") +
         (judgement == Judgement::recoverable ? "Recoverable" : "Unrecoverable") +
         (extent == Extent::once ? "Once" : "FromThenOn");
}

/// Invariants after a sync, whichever call failed.
void expectWholeDevice(WholeSync& sync) {
  expectNothingPending(sync.platform);
  const auto kept = sync.platform.registry.app("com.keep");
  ASSERT_TRUE(kept) << "an unrelated app was removed";
  EXPECT_TRUE(kept->isInstalled && !kept->isPlaceholder);
}

/// The state after two syncs without failures.
DeviceState undisturbed(Mode mode) {
  WholeSync sync(mode);
  sync.run(Transfers::someFail);
  expectWholeDevice(sync);
  sync.restartDevice();
  sync.run(Transfers::allArrive);
  expectWholeDevice(sync);
  EXPECT_EQ(sync.todoOperations(), sync.expectedTodoOperations());
  return sync.deviceState();
}

class SyncFault : public testing::TestWithParam<Conditions> {
 protected:
  static Mode mode() { return std::get<Mode>(GetParam()); }

  static void judge(WholeSync& sync) {
    if (std::get<Judgement>(GetParam()) == Judgement::recoverable)
      sync.platform.framework.judgeErrorsBy([](const Error&) { return true; });
  }

  static std::size_t callsOfOneSync() {
    WholeSync sync(mode());
    judge(sync);
    sync.run(Transfers::someFail);
    return sync.platform.journal.callCount();
  }

  /// Runs a sync whose `number`-th call fails, and a second one.
  static void syncWithFault(std::size_t number, const DeviceState& expected) {
    WholeSync sync(mode());
    judge(sync);
    const Extent extent = std::get<Extent>(GetParam());
    const Fault fault(number, extent);
    sync.platform.journal.setHook(fault.hook());
    sync.run(Transfers::someFail);
    sync.platform.journal.setHook(nullptr);
    SCOPED_TRACE("call " + std::to_string(number) + ": " + fault.call());
    EXPECT_TRUE(fault.hasHappened());
    expectWholeDevice(sync);
    sync.restartDevice();
    sync.run(Transfers::allArrive);
    expectWholeDevice(sync);
    EXPECT_EQ(sync.todoOperations(), sync.expectedTodoOperations());
    EXPECT_EQ(sync.deviceState(), expected);
    // If all later calls fail, nothing can be cleaned up: an app's state remains until its next install, a promise
    // permanently. A parked package of the store stays parked.
    if (extent == Extent::once) {
      EXPECT_TRUE(sync.platform.coordination.abandoned().empty())
          << "a promise or placeholder is neither attached nor cancelled";
      EXPECT_EQ(sync.platform.files.has(kRestoreStatePath), mode() == Mode::coordinated);
    }
  }
};

TEST_P(SyncFault, SyncAfterAnyFailedCallReachesTheSameState) {
  const DeviceState expected = undisturbed(mode());
  const std::size_t calls = callsOfOneSync();
  EXPECT_GT(calls, 300U) << "the sync makes fewer calls than expected";
  RecordProperty("calls", static_cast<int>(calls));
  std::cout << "platform calls: " << calls << '\n';
  for (std::size_t number = 1; number <= calls; ++number)
    runWithTimeout(number, [&] { syncWithFault(number, expected); });
}

INSTANTIATE_TEST_SUITE_P(Direct, SyncFault,
                         testing::Combine(testing::Values(Mode::direct),
                                          testing::Values(Judgement::unrecoverable, Judgement::recoverable),
                                          testing::Values(Extent::once, Extent::fromThenOn)),
                         nameOf);
// In coordinated mode every error is unrecoverable, regardless of the framework.
INSTANTIATE_TEST_SUITE_P(Coordinated, SyncFault,
                         testing::Combine(testing::Values(Mode::coordinated), testing::Values(Judgement::unrecoverable),
                                          testing::Values(Extent::once, Extent::fromThenOn)),
                         nameOf);

TEST(WholeSyncTest, OrderOfCallsIsTheSameInEveryRun) {
  const auto linesOf = [](Mode mode) {
    WholeSync sync(mode);
    sync.run(Transfers::someFail);
    return sync.platform.journal.lines();
  };
  EXPECT_EQ(linesOf(Mode::direct), linesOf(Mode::direct));
  EXPECT_EQ(linesOf(Mode::coordinated), linesOf(Mode::coordinated));
}

TEST(WholeSyncTest, SyncWithoutFailuresInstallsAllButTheBadApp) {
  EXPECT_EQ(undisturbed(Mode::direct), (DeviceState{{"com.broken", "2.0", true, false},
                                                    {"com.denied", "2.0", true, false},
                                                    {"com.flaky", "2.0", true, false},
                                                    {"com.keep", "1.0", true, false},
                                                    {"com.new", "2.0", true, false},
                                                    {"com.parked", "2.0", true, false},
                                                    {"com.restored", "2.0", true, false},
                                                    {"com.update", "2.0", true, false}}));
}

TEST(WholeSyncTest, CoordinatedRestoresWaitForTheStore) {
  EXPECT_EQ(undisturbed(Mode::coordinated), (DeviceState{{"com.broken", "2.0", true, false},
                                                         {"com.denied", "2.0", true, false},
                                                         {"com.flaky", "2.0", true, false},
                                                         {"com.keep", "1.0", true, false},
                                                         {"com.new", "2.0", true, false},
                                                         {"com.parked", "2.0", false, true},
                                                         {"com.restored", "2.0", false, true},
                                                         {"com.update", "2.0", true, false}}));
}

}  // namespace
}  // namespace appsync::test
