// Each call of a preparation fails in turn: what is given up, in which order, for which reason.
#include <string>

#include <gtest/gtest.h>

#include "tests/coordination/CoordinationFixture.h"
#include "tests/support/FatalCall.h"

namespace appsync::test {
namespace {

using platform::TransactionPhase;
using platform::TransactionStep;

const std::string kCoordinatorGoes = "coordinator.cancelForReason com.a ZTError 1 3";

class PreparationFailure : public CoordinationFixture, public testing::WithParamInterface<FatalCall> {};

TEST_P(PreparationFailure, NothingOfThePlugInsOwnIsLeft) {
  const FatalCall& call = GetParam();
  call.failNext(platform, error);
  EXPECT_FALSE(makeTracedClient().prepareAppForInstallUsingCoordination(asset, false));

  call.expectComplaints(platform.log, error);
  call.expectCancellations(platform.journal);
  EXPECT_TRUE(platform.coordination.coordinators().empty());
  EXPECT_TRUE(platform.coordination.abandoned().empty());
  for (const FakePromise& promise : platform.coordination.promises())
    EXPECT_TRUE(promise.cancellation) << promise.name;
  for (const FakePlaceholder& placeholder : platform.coordination.placeholders())
    EXPECT_EQ(placeholder.cancellation, (FakeCancellation{{"ZTError", 1, {}, nullptr}, kSync}));

  EXPECT_EQ(platform.transactions.steps().back(),
            (StepEntry{TransactionStep::installApp, TransactionPhase::end, Success::no, "com.a", "Install app"}));
}

/// The end is said and recorded before anything is cancelled, the placeholder before the coordinator.
TEST_P(PreparationFailure, TheEndIsSaidBeforeAnythingIsCancelled) {
  const FatalCall& call = GetParam();
  call.failNext(platform, error);
  EXPECT_FALSE(makeTracedClient().prepareAppForInstallUsingCoordination(asset, false));
  LogLines expected{logged("processing app install for bundle com.a finished with status 0 error " +
                           (call.endsWithError ? description(error) : "(null)")),
                    called("transactionLog.logStep 1 com.a n Install app")};
  for (const std::string& line : call.cancelled) {
    if (line.starts_with("promise.")) continue;
    const bool isPlaceholder = line.starts_with("placeholder.");
    expected.push_back(logged(std::string("Cancelling ") + (isPlaceholder ? "placeholder" : "coordinator") +
                              " for appBundleIdentifier:com.a"));
    expected.push_back(called(line));
  }
  expectEnd(expected, platform.log.lines());
}

INSTANTIATE_TEST_SUITE_P(
    Calls, PreparationFailure,
    testing::Values(FatalCall{"installCoordination.coordinatorForApp", "com.a", {}, true, {}},
                    FatalCall{"coordinator.setInstallOptions",
                              "com.a",
                              {"Error % setting install options on coordinator for 'com.a'"},
                              true,
                              {kCoordinatorGoes}},
                    FatalCall{"coordinator.setInitialODRAssetPromises",
                              "com.a",
                              {"Error % setting ODR asset promise for 'com.a'"},
                              true,
                              {kCoordinatorGoes}},
                    FatalCall{"installCoordination.makePromisedTransferToPath",
                              "com.a-Asset",
                              {"Error creating asset promise for 'com.a'"},
                              false,
                              {kCoordinatorGoes}},
                    FatalCall{"coordinator.setAppAssetPromise",
                              "com.a",
                              {"Error % adding app asset promise at (null) to 'com.a'",
                               "Cancelling asset promise for 'com.a'"},
                              false,
                              {"promise.cancelForReason com.a-Asset ZTError 30 3", kCoordinatorGoes}},
                    FatalCall{"coordinator.setPlaceholderPromise",
                              "com.a",
                              {"Error % adding placeholder promise to coordinator for 'com.a'"},
                              true,
                              {"placeholder.cancelForReason com.a ZTError 1 3", kCoordinatorGoes}}),
    nameOfCall);

class PreparationFaults : public CoordinationFixture {};

/// Whatever fails, a preparation that says no has left nothing, and one that says yes a coordinator that can go on.
TEST_F(PreparationFaults, WhicheverCallFailsNothingIsLeftHalfway) {
  AppsClient& client = makeClient();
  const std::size_t before = platform.journal.callCount();
  EXPECT_TRUE(client.prepareAppForInstallUsingCoordination(asset, false));
  const std::size_t calls = platform.journal.callCount() - before;
  EXPECT_GT(calls, 30U);
  for (std::size_t number = 1; number <= calls; ++number) {
    SCOPED_TRACE("call " + std::to_string(number) + " of " + std::to_string(calls));
    for (const FakeCoordinator& coordinator : platform.coordination.coordinators())
      platform.coordination.cancel(coordinator.identifier, {error, kSync});
    platform.files.erase(kPlaceholderFolder);
    platform.journal.failCall(number, error);
    const bool isReady = client.prepareAppForInstallUsingCoordination(asset, false);
    platform.journal.setHook(nullptr);
    const auto left = platform.coordination.coordinator("com.a");
    EXPECT_EQ(left.has_value(), isReady);
    EXPECT_TRUE(platform.coordination.abandoned().empty());
    if (!left) continue;
    EXPECT_TRUE(left->options && left->initialODRAssets && left->appAsset);
  }
}

/// A coordinator that cannot even be cancelled is the service's to end: what is the plug-in's alone goes all the same.
TEST_F(PreparationFaults, ACancellationThatFailsLeavesTheCoordinatorToTheService) {
  platform.coordination.failures.failNext("coordinator.setPlaceholderPromise", "com.a", error);
  platform.coordination.failures.failNext("coordinator.cancelForReason", "com.a", error);
  EXPECT_FALSE(makeClient().prepareAppForInstallUsingCoordination(asset, false));
  EXPECT_TRUE(platform.coordination.abandoned().empty());
  EXPECT_EQ(platform.coordination.coordinators().size(), 1U);
}

}  // namespace
}  // namespace appsync::test
