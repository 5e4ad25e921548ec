// Removing apps at the start of a sync, on a device that installs through coordinators.
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "kit/fakes/SyncFileBuilder.h"
#include "tests/support/ClientFixture.h"

namespace appsync::test {
namespace {

using Strings = std::vector<std::string>;

class ReconcileSyncCoordination : public ClientFixture {
 protected:
  bool reconcile(plist::Array todoList) {
    platform.coordination.enable();
    putPropertyList(platform.files, kStagedTodoListPath, std::move(todoList));
    return makeClient().reconcileSync({}, "anchor", nullptr, nullptr);
  }
};

TEST_F(ReconcileSyncCoordination, RemovalsGoThroughTheServiceInTheListsOrder) {
  platform.registry.add(FakeApp::installed("com.a"));
  platform.registry.add(FakeApp::installed("com.b"));
  EXPECT_TRUE(reconcile({removeEntry("com.b"), installEntry("com.c"), removeEntry("com.a")}));
  platform.coordination.waitUntilIdle();
  EXPECT_EQ(platform.journal.lines({"installCoordination.uninstallApp", "registry.uninstall"}),
            (Strings{"installCoordination.uninstallApp com.b", "installCoordination.uninstallApp com.a"}));
  EXPECT_TRUE(platform.registry.identifiers().empty());
  EXPECT_TRUE(platform.transactions.scenarios().empty());
  EXPECT_EQ(platform.transactions.steps().size(), 4U);
}

TEST_F(ReconcileSyncCoordination, TheSyncGoesOnBeforeTheAppsAreGone) {
  platform.registry.add(FakeApp::installed("com.a"));
  platform.coordination.gate.close();
  EXPECT_TRUE(reconcile({removeEntry("com.a")}));
  EXPECT_TRUE(platform.log.contains(logged("finished reconcile sync")));
  EXPECT_TRUE(platform.registry.app("com.a"));
  platform.coordination.gate.open();
}

TEST_F(ReconcileSyncCoordination, AFailedRemovalChangesNothing) {
  platform.coordination.failures.failAlways("installCoordination.uninstallApp", kAnything, installerError("no"));
  EXPECT_TRUE(reconcile({removeEntry("com.a"), removeEntry("com.b")}));
  platform.coordination.waitUntilIdle();
  EXPECT_EQ(platform.journal.count("installCoordination.uninstallApp"), 2U);
  EXPECT_FALSE(platform.log.contains(loggedError("Uninstall of com.a failed.")));
}

TEST_F(ReconcileSyncCoordination, ARestrictedRemovalNeverReachesTheService) {
  platform.restrictions.set(platform::RestrictionSetting::appRemovalAllowed, platform::RestrictionValue::no);
  EXPECT_TRUE(reconcile({removeEntry("com.a")}));
  EXPECT_EQ(platform.journal.count("installCoordination.uninstallApp"), 0U);
}

}  // namespace
}  // namespace appsync::test
