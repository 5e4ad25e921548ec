// Each call of a coordinated transfer, of its end and of a report fails in turn.
#include <atomic>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "tests/coordination/CoordinationFixture.h"

namespace appsync::test {
namespace {

using Strings = std::vector<std::string>;

constexpr std::string_view kRestoreStatePath = "/var/mobile/Library/ApplicationSync/RestoreState.plist";

class CoordinatedTransferFailure : public CoordinationFixture {
 protected:
  void SetUp() override {
    CoordinationFixture::SetUp();
    platform.files.put(kReceivedPackage, "package");
    platform.files.put(kTodoListPath, binaryForm(plist::Array{entry("com.a", "DOWNLOADED")}));
    putPropertyList(platform.files, kRestoreStatePath, plist::Dictionary{{"com.a", plist::Dictionary{}}});
    asset.setPath(std::string(kReceivedPackage));
    platform.coordination.add(prepared());
  }

  /// A client whose next call of that operation fails.
  AppsClient& makeFailing(std::string_view operation) {
    AppsClient& client = makeClient();
    platform.log.clear();
    hasFailed_ = false;
    platform.journal.setHook([this, operation](std::string_view called, std::string_view) -> std::optional<Error> {
      return called == operation && !hasFailed_.exchange(true) ? std::optional(error) : std::nullopt;
    });
    return client;
  }

  /// What the client said after the look-up of its coordinator.
  [[nodiscard]] testing::AssertionResult saidAfterLookUp(const LogLines& expected) const {
    const LogLines lines = platform.log.lines();
    if (lines.empty()) return testing::AssertionFailure() << "nothing was said";
    return sameLines(expected, {lines.begin() + 1, lines.end()});
  }

  [[nodiscard]] LogLines secondPromiseRefused(const std::string& last) const {
    const Error refused = coordinationError("setAppAssetPromise was called before");
    return {loggedError("Error " + description(refused) + " adding app asset promise at " +
                        std::string(kReceivedPackage) + " to 'com.a'"),
            loggedError("Cancelling asset promise for 'com.a'"), logged(last)};
  }

 private:
  std::atomic<bool> hasFailed_ = false;
};

TEST_F(CoordinatedTransferFailure, ACoordinatorThatCannotBeLookedUpIsNone) {
  const auto operations = std::vector<std::function<void(AppsClient&)>>{
      [&](AppsClient& client) { EXPECT_FALSE(client.updateTransferProgressForApp(asset, false)); },
      [&](AppsClient& client) { client.transferCompleteForApp(asset, std::nullopt, false); },
      [&](AppsClient& client) { client.transferCompleteForApp(asset, error, false); },
      [&](AppsClient& client) { client.assetSyncFinishedWithStatus(false, {"com.a"}); },
  };
  for (const auto& operation : operations) {
    operation(makeFailing("installCoordination.coordinatorForApp"));
    EXPECT_TRUE(platform.log.lines().empty());
    EXPECT_EQ(platform.journal.lines({"coordinator.", "promise."}), Strings{});
    EXPECT_EQ(platform.coordination.coordinators().size(), 1U);
  }
}

TEST_F(CoordinatedTransferFailure, ProgressWhosePromiseCannotBeReadLeavesNoSecondOne) {
  EXPECT_TRUE(makeFailing("coordinator.appAssetPromise").updateTransferProgressForApp(asset, false));
  EXPECT_TRUE(saidAfterLookUp(
      secondPromiseRefused("Updating download progress: 0.000000 install progress:0.000000 for com.a")));
  EXPECT_TRUE(platform.coordination.abandoned().empty());
}

TEST_F(CoordinatedTransferFailure, ACompletionWhosePromiseCannotBeReadLeavesNoSecondOne) {
  makeFailing("coordinator.appAssetPromise").transferCompleteForApp(asset, std::nullopt, false);
  EXPECT_TRUE(saidAfterLookUp(secondPromiseRefused("Satisfying asset promise for com.a")));
  EXPECT_TRUE(platform.coordination.abandoned().empty());
  EXPECT_FALSE(platform.coordination.coordinator("com.a")->appAsset->isComplete);
}

TEST_F(CoordinatedTransferFailure, ACancellationThatFailsAfterATransferIsIgnored) {
  makeFailing("coordinator.cancelForReason").transferCompleteForApp(asset, error, false);
  EXPECT_TRUE(saidAfterLookUp({}));
  EXPECT_EQ(platform.coordination.coordinators().size(), 1U);
}

TEST_F(CoordinatedTransferFailure, ACancellationThatFailsAtTheEndDoesNotKeepTheOthers) {
  platform.coordination.add(prepared("com.b"));
  makeFailing("coordinator.cancelForReason").assetSyncFinishedWithStatus(false, {"com.a", "com.b"});
  ASSERT_EQ(platform.coordination.coordinators().size(), 1U);
  EXPECT_EQ(platform.coordination.coordinators()[0].identifier, "com.a");
}

TEST_F(CoordinatedTransferFailure, ATodoListThatCannotBeWrittenDoesNotKeepTheRestoreState) {
  makeFailing("fileSystem.writeFileAtomically").setupInstallCoordinatorObserver();
  platform.coordination.complete("com.a", std::nullopt, CallbackOn::callingThread);
  EXPECT_EQ(operationWord(platform.files, "com.a"), "DOWNLOADED");
  EXPECT_FALSE(platform.files.has(kRestoreStatePath));
}

struct ReportFailure {
  const char* operation;
  /// What is said, in order, and whether as an error.
  LogLines said;
  Strings asked;
};

TEST_F(CoordinatedTransferFailure, ReportsWhoseCallsFailEndInAMessage) {
  const std::vector<ReportFailure> prioritizing{
      {"coordinator.bundleID", {}, {}},
      {"deviceService.supports",
       {logged("Prioritize com.a"), loggedError("Cannot prioritize com.a as it's not supported")},
       {"deviceService.supports prioritizeAsset"}},
      {"deviceService.prioritizeAsset",
       {logged("Prioritize com.a"), logged("Prioritize com.a finished with error " + description(error))},
       {"deviceService.supports prioritizeAsset", "deviceService.prioritizeAsset com.a"}}};
  for (const ReportFailure& failure : prioritizing) {
    makeFailing(failure.operation).setupInstallCoordinatorObserver();
    platform.journal.clear();
    platform.coordination.prioritize("com.a", CallbackOn::callingThread);
    EXPECT_TRUE(sameLines(failure.said, platform.log.lines())) << failure.operation;
    EXPECT_EQ(platform.journal.lines({"deviceService."}), failure.asked) << failure.operation;
  }
}

TEST_F(CoordinatedTransferFailure, ACancellationWhoseCallsFailEndsInAMessage) {
  const std::vector<ReportFailure> cancelling{
      {"coordinator.bundleID", {}, {}},
      {"deviceService.supports",
       {loggedError("Cannot cancel com.a as it's already cancelled 0 OR the call is not supported")},
       {"deviceService.supports cancelAssetTransferForFailedAsset"}}};
  for (const ReportFailure& failure : cancelling) {
    makeFailing(failure.operation).setupInstallCoordinatorObserver();
    platform.journal.clear();
    platform.coordination.cancelByUser("com.a", CallbackOn::callingThread);
    EXPECT_TRUE(sameLines(failure.said, platform.log.lines())) << failure.operation;
    EXPECT_EQ(platform.journal.lines({"deviceService."}), failure.asked) << failure.operation;
    platform.coordination.add(prepared());
  }
}

/// Whatever fails on the way from the first byte to the end, no promise is left that nobody will keep.
TEST_F(CoordinatedTransferFailure, WhicheverCallFailsNoPromiseIsAbandoned) {
  const auto received = std::make_shared<platform::ZTAsset>("com.a", "Application", "A");
  received->setIsDownload(true);
  platform.registry.add(FakeApp::placeholder("com.a"));
  for (const bool arrives : {true, false}) {
    std::size_t calls = 1;
    for (std::size_t number = 0; number <= calls; ++number) {
      SCOPED_TRACE("call " + std::to_string(number));
      for (const FakeCoordinator& coordinator : platform.coordination.coordinators())
        platform.coordination.cancel(coordinator.identifier, {error, kSync});
      platform.coordination.add(FakeCoordinator::of("com.a"));  // Even the promise is still to be made.
      platform.files.put(kReceivedPackage, "package");
      received->setPath(std::string(kReceivedPackage));
      AppsClient& client = makeClient();
      const std::size_t before = platform.journal.callCount();
      if (number > 0) platform.journal.failCall(number, error);
      client.assetTransferUpdatedProgress(received, 0.5);
      client.assetTransferSucceeded(received, arrives, arrives ? std::nullopt : std::optional(error));
      client.assetTransferEndedWithSuccess(arrives);
      if (number == 0) calls = platform.journal.callCount() - before;
      platform.journal.setHook(nullptr);
      EXPECT_TRUE(platform.coordination.abandoned().empty());
    }
    EXPECT_GT(calls, 15U);
  }
}

}  // namespace
}  // namespace appsync::test
