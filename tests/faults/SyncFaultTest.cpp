// Every platform call of a whole sync fails once: nothing breaks, and the next sync makes good what was missed.
#include <chrono>
#include <cstddef>
#include <cstdlib>
#include <future>
#include <iostream>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>
#include <tuple>

#include <gtest/gtest.h>

#include "core/SyncFiles.h"
#include "kit/fakes/TodoList.h"
#include "tests/faults/WholeSync.h"

namespace appsync::test {
namespace {

using Transfers = WholeSync::Transfers;

/// Real time: the end of a test that hangs, never a pace.
constexpr std::chrono::seconds kPatience(60);

constexpr std::string_view kRestoreStatePath = "/var/mobile/Library/ApplicationSync/RestoreState.plist";
const Error kInjected{"POSIX", 5, "Input/output error", nullptr};

/// Whether the sync framework calls the injected failure one that may pass.
enum class Judgement { unrecoverable, recoverable };
/// Whether one call fails or, as when a service has died, every call from that one on.
enum class Extent { once, fromThenOn };
using Fault = std::tuple<Mode, Judgement, Extent>;

std::string nameOf(const testing::TestParamInfo<Fault>& info) {
  const auto& [mode, judgement, extent] = info.param;
  return std::string(mode == Mode::coordinated ? "Coordinated" : "Direct") +
         (judgement == Judgement::recoverable ? "Recoverable" : "Unrecoverable") +
         (extent == Extent::once ? "Once" : "FromThenOn");
}

/// Whatever failed, this holds after a sync.
void expectInOrder(WholeSync& sync) {
  FakePlatform& platform = sync.platform;
  EXPECT_EQ(platform.time.pendingTasks(), 0U);
  EXPECT_TRUE(platform.screen.held().empty()) << "an app stays held";
  EXPECT_EQ(platform.registry.observerCount(), 0U);
  EXPECT_EQ(platform.notify.observerCount("com.corvel.zeph.ZTStartupCompleteNotification"), 0U);
  EXPECT_EQ(platform.backups.connections(), 0U);
  EXPECT_EQ(platform.store.connections(), 0U);
  for (const auto& connection : platform.coordination.connections())
    EXPECT_FALSE(connection.isOpen);
  for (const std::string& path : platform.files.paths()) {
    if (!path.ends_with(".plist")) continue;
    EXPECT_TRUE(propertyListAt(platform.files, path)) << path << " is half written";
  }
  const auto kept = platform.registry.app("com.keep");
  ASSERT_TRUE(kept) << "an app that nobody asked about is gone";
  EXPECT_TRUE(kept->isInstalled && !kept->isPlaceholder);
}

/// The state that two undisturbed syncs end in.
DeviceState undisturbed(Mode mode) {
  WholeSync sync(mode);
  sync.run(Transfers::someFail);
  expectInOrder(sync);
  sync.restartDevice();
  sync.run(Transfers::allArrive);
  expectInOrder(sync);
  EXPECT_EQ(sync.todoWords(), sync.expectedTodoWords());
  return sync.deviceState();
}

class SyncFault : public testing::TestWithParam<Fault> {
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

  /// A first sync whose `number`-th call fails, and a second one.
  static void syncWithFault(std::size_t number, const DeviceState& expected) {
    WholeSync sync(mode());
    judge(sync);
    const Extent extent = std::get<Extent>(GetParam());
    std::mutex mutex;
    std::string failed = "none";
    std::size_t call = 0;
    sync.platform.journal.setHook([&](std::string_view operation, std::string_view arguments) -> std::optional<Error> {
      const std::scoped_lock lock(mutex);
      ++call;
      if (call == number) failed = std::string(operation) + " " + std::string(arguments);
      // What kind of device it is no call changes.
      if (operation == "installCoordination.coordinationIsEnabled") return std::nullopt;
      const bool fails = extent == Extent::once ? call == number : call >= number;
      return fails ? std::optional(kInjected) : std::nullopt;
    });
    sync.run(Transfers::someFail);
    sync.platform.journal.setHook(nullptr);
    SCOPED_TRACE("call " + std::to_string(number) + ": " + failed);
    EXPECT_NE(failed, "none");
    expectInOrder(sync);
    sync.restartDevice();
    sync.run(Transfers::allArrive);
    expectInOrder(sync);
    EXPECT_EQ(sync.todoWords(), sync.expectedTodoWords());
    EXPECT_EQ(sync.deviceState(), expected);
    // Who cannot call any more cannot clean up: an app's state stays until its next install, a promise for good.
    // A parked package that is the store's stays parked.
    if (extent == Extent::once) {
      EXPECT_TRUE(sync.platform.coordination.abandoned().empty()) << "something is neither attached nor cancelled";
      EXPECT_EQ(sync.platform.files.has(kRestoreStatePath), mode() == Mode::coordinated);
    }
  }

  /// Runs it on another thread, so that a hang ends the program with a word instead of waiting for ever.
  static void syncWithinPatience(std::size_t number, const DeviceState& expected) {
    const auto done = std::async(std::launch::async, [&] { syncWithFault(number, expected); });
    if (done.wait_for(kPatience) == std::future_status::ready) return;
    std::cerr << "the sync hangs when call " << number << " fails\n";
    std::abort();
  }
};

TEST_P(SyncFault, WhicheverCallFailsTheNextSyncEndsInTheSameState) {
  const DeviceState expected = undisturbed(mode());
  const std::size_t calls = callsOfOneSync();
  EXPECT_GT(calls, 300U) << "the sync has lost most of what it did";
  RecordProperty("calls", static_cast<int>(calls));
  for (std::size_t number = 1; number <= calls; ++number)
    syncWithinPatience(number, expected);
}

INSTANTIATE_TEST_SUITE_P(Direct, SyncFault,
                         testing::Combine(testing::Values(Mode::direct),
                                          testing::Values(Judgement::unrecoverable, Judgement::recoverable),
                                          testing::Values(Extent::once, Extent::fromThenOn)),
                         nameOf);
// Under coordination every error is unrecoverable, whatever the framework says.
INSTANTIATE_TEST_SUITE_P(Coordinated, SyncFault,
                         testing::Combine(testing::Values(Mode::coordinated), testing::Values(Judgement::unrecoverable),
                                          testing::Values(Extent::once, Extent::fromThenOn)),
                         nameOf);

TEST(WholeSyncTest, TheCallsComeInTheSameOrderInEveryRun) {
  const auto linesOf = [](Mode mode) {
    WholeSync sync(mode);
    sync.run(Transfers::someFail);
    return sync.platform.journal.lines();
  };
  EXPECT_EQ(linesOf(Mode::direct), linesOf(Mode::direct));
  EXPECT_EQ(linesOf(Mode::coordinated), linesOf(Mode::coordinated));
}

TEST(WholeSyncTest, UndisturbedItEndsWithEveryAppButTheBadOne) {
  EXPECT_EQ(undisturbed(Mode::direct), (DeviceState{{"com.broken", "2.0", true, false},
                                                    {"com.denied", "2.0", true, false},
                                                    {"com.flaky", "2.0", true, false},
                                                    {"com.keep", "1.0", true, false},
                                                    {"com.new", "2.0", true, false},
                                                    {"com.parked", "2.0", true, false},
                                                    {"com.restored", "2.0", true, false},
                                                    {"com.update", "2.0", true, false}}));
}

TEST(WholeSyncTest, UnderCoordinationRestoresWaitForTheStore) {
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
