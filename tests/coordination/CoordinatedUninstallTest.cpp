// Removing an app through the install-coordination service.
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "tests/coordination/CoordinationFixture.h"

namespace appsync::test {
namespace {

using platform::TransactionPhase;
using platform::TransactionStep;
using Steps = std::vector<StepEntry>;

class CoordinatedUninstall : public CoordinationFixture {};

StepEntry begun() {
  return {TransactionStep::uninstallApp, TransactionPhase::begin, Success::yes, "com.a", "Uninstall app"};
}

StepEntry ended(Success success) {
  return {TransactionStep::uninstallApp, TransactionPhase::end, success, "com.a", "Uninstall app"};
}

TEST_F(CoordinatedUninstall, TheAppGoesWithoutAQuestionAndBothEntriesAreWritten) {
  platform.registry.add(FakeApp::installed("com.a"));
  AppsClient& client = makeTracedClient();
  client.uninstallAppUsingCoordination("com.a");
  platform.coordination.waitUntilIdle();
  EXPECT_FALSE(platform.registry.app("com.a"));
  EXPECT_TRUE(sameLines(
      {called("transactionLog.logStep 7 com.a y Uninstall app"), called("installCoordination.uninstallApp com.a"),
       logged("Uninstall of com.a with install coordinator succeeded wiht error (null)."),
       called("transactionLog.logStep 7 com.a y Uninstall app")},
      platform.log.lines()));
  EXPECT_EQ(platform.transactions.steps(), (Steps{begun(), ended(Success::yes)}));
}

TEST_F(CoordinatedUninstall, AFailureIsLoggedInTheSameWordsAndRecordedAsOne) {
  AppsClient& client = makeClient();
  platform.coordination.failures.failNext("installCoordination.uninstallApp", "com.a", error);
  client.uninstallAppUsingCoordination("com.a");
  platform.coordination.waitUntilIdle();
  EXPECT_TRUE(said("Uninstall of com.a with install coordinator succeeded wiht error " + description(error) + "."));
  EXPECT_EQ(platform.transactions.steps(), (Steps{begun(), ended(Success::no)}));
}

TEST_F(CoordinatedUninstall, ItReturnsBeforeTheAppIsGone) {
  platform.registry.add(FakeApp::installed("com.a"));
  AppsClient& client = makeClient();
  platform.coordination.gate.close();
  client.uninstallAppUsingCoordination("com.a");
  platform.coordination.gate.waitUntilStopped(1);
  EXPECT_TRUE(platform.registry.app("com.a"));
  EXPECT_EQ(platform.transactions.steps(), Steps{begun()});
  platform.coordination.gate.open();
}

TEST_F(CoordinatedUninstall, TheOutcomeIsLoggedWhenTheObjectIsLongGone) {
  platform.registry.add(FakeApp::installed("com.a"));
  platform.coordination.gate.close();
  makeClient().uninstallAppUsingCoordination("com.a");
  const std::weak_ptr<AppsClient> gone = takeClient();
  EXPECT_TRUE(gone.expired());
  platform.coordination.gate.open();
  platform.coordination.waitUntilIdle();
  EXPECT_TRUE(said("Uninstall of com.a with install coordinator succeeded wiht error (null)."));
  EXPECT_EQ(platform.transactions.steps(), (Steps{begun(), ended(Success::yes)}));
}

TEST_F(CoordinatedUninstall, ACompletionBeforeTheCallReturnsIsTheSame) {
  platform.registry.add(FakeApp::installed("com.a"));
  platform.coordination.completeUninstalls(CallbackOn::callingThread);
  makeClient().uninstallAppUsingCoordination("com.a");
  EXPECT_EQ(platform.transactions.steps(), (Steps{begun(), ended(Success::yes)}));
}

}  // namespace
}  // namespace appsync::test
