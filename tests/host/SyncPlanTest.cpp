#include <gtest/gtest.h>

#include "host/SyncPlan.h"

namespace appsync::host {
namespace {

/// The plan for a library and a device.
class SyncPlan : public testing::Test {
 protected:
  void libraryHas(const std::string& identifier, const std::string& version) {
    library_.packages[identifier] = {identifier + ".zip", {identifier, "Name", version}, 100};
  }
  void deviceHas(const std::string& identifier, const std::string& version) {
    DeviceApp app;
    app.name = {identifier, "Name", version};
    app.isInstalled = true;
    apps_[identifier] = app;
  }
  void deviceAwaits(const std::string& identifier) {
    deviceHas(identifier, "1.0");
    apps_[identifier].isInstalled = false;
    apps_[identifier].isPlaceholder = true;
  }
  std::vector<PlannedApp> plan() { return makePlan({library_, apps_, declined_, only_, remove_, fromStore_}); }
  PlannedApp planOfOne() {
    const auto all = plan();
    EXPECT_EQ(all.size(), 1U);
    return all.empty() ? PlannedApp{} : all.front();
  }

  Library library_;
  std::map<std::string, DeviceApp, std::less<>> apps_;
  IdentifierSet declined_;
  IdentifierSet only_;
  IdentifierSet remove_;
  IdentifierSet fromStore_;
};

TEST_F(SyncPlan, EmptyLibraryPlansNothing) {
  deviceHas("org.a", "1.0");
  EXPECT_TRUE(plan().empty());
}

TEST_F(SyncPlan, InstallsMissingApp) {
  libraryHas("org.a", "1.0");
  const PlannedApp app = planOfOne();
  EXPECT_EQ(app.work, PlannedWork::install);
  EXPECT_EQ(app.package, &library_.packages["org.a"]);
}

TEST_F(SyncPlan, UpdatesToNewerVersion) {
  libraryHas("org.a", "1.10");
  deviceHas("org.a", "1.9");
  EXPECT_EQ(planOfOne().work, PlannedWork::update);
}

TEST_F(SyncPlan, LeavesSameVersion) {
  libraryHas("org.a", "1.0");
  deviceHas("org.a", "1.0.0");
  const PlannedApp app = planOfOne();
  EXPECT_EQ(app.work, PlannedWork::none);
  EXPECT_EQ(app.package, nullptr);
}

TEST_F(SyncPlan, KeepsNewerVersionOnDevice) {
  libraryHas("org.a", "1.0");
  deviceHas("org.a", "2.0");
  const PlannedApp app = planOfOne();
  EXPECT_EQ(app.work, PlannedWork::skip);
  EXPECT_EQ(app.reason, "the device has the newer version 2.0, the library 1.0");
}

TEST_F(SyncPlan, InstallsAppWithPlaceholder) {
  libraryHas("org.a", "1.0");
  deviceAwaits("org.a");
  EXPECT_EQ(planOfOne().work, PlannedWork::install);
}

TEST_F(SyncPlan, SkipsDeletedApp) {
  libraryHas("org.a", "2.0");
  declined_ = {"org.a"};
  EXPECT_EQ(planOfOne().work, PlannedWork::skip);
}

TEST_F(SyncPlan, InstallsRequestedDeletedApp) {
  libraryHas("org.a", "2.0");
  declined_ = only_ = {"org.a"};
  EXPECT_EQ(planOfOne().work, PlannedWork::install);
}

TEST_F(SyncPlan, UpdatesReinstalledDeletedApp) {
  libraryHas("org.a", "2.0");
  deviceHas("org.a", "1.0");
  declined_ = {"org.a"};
  EXPECT_EQ(planOfOne().work, PlannedWork::update);
}

TEST_F(SyncPlan, OnlySelectsApps) {
  libraryHas("org.a", "1.0");
  libraryHas("org.b", "1.0");
  library_.broken.push_back({"broken.zip", "it is damaged"});
  only_ = {"org.b"};
  EXPECT_EQ(planOfOne().name.identifier, "org.b");
}

TEST_F(SyncPlan, RefusesRequestedAppWithoutPackage) {
  only_ = {"org.c"};
  const PlannedApp app = planOfOne();
  EXPECT_EQ(app.work, PlannedWork::refuse);
  EXPECT_EQ(app.name.identifier, "org.c");
}

TEST_F(SyncPlan, RefusesBrokenPackageByFileName) {
  library_.broken.push_back({"broken.zip", "it is damaged"});
  const PlannedApp app = planOfOne();
  EXPECT_EQ(app.work, PlannedWork::refuse);
  EXPECT_EQ(app.name.identifier, "broken.zip");
  EXPECT_EQ(app.reason, "it is damaged");
}

TEST_F(SyncPlan, DoesNotInstallRemovedApp) {
  libraryHas("org.a", "2.0");
  deviceHas("org.a", "1.0");
  remove_ = {"org.a"};
  const PlannedApp app = planOfOne();
  EXPECT_EQ(app.work, PlannedWork::remove);
  EXPECT_EQ(app.name.version, "1.0");
}

TEST_F(SyncPlan, SkipsRemovalOfMissingApp) {
  remove_ = {"org.a"};
  EXPECT_EQ(planOfOne().work, PlannedWork::skip);
}

TEST_F(SyncPlan, PlansRemovalsFirst) {
  libraryHas("org.a", "1.0");
  deviceHas("org.b", "1.0");
  remove_ = {"org.b"};
  const auto all = plan();
  ASSERT_EQ(all.size(), 2U);
  EXPECT_EQ(all[0].work, PlannedWork::remove);
  EXPECT_EQ(all[1].work, PlannedWork::install);
}

TEST_F(SyncPlan, SkipsDemotedAppUnlessRequested) {
  libraryHas("org.a", "1.0");
  deviceAwaits("org.a");
  apps_["org.a"].installType = platform::TSInstallType::IntentionalDowngrade;
  const PlannedApp app = planOfOne();
  EXPECT_EQ(app.work, PlannedWork::skip);
  EXPECT_NE(app.reason.find("it is demoted"), std::string::npos);
  only_ = {"org.a"};
  EXPECT_EQ(planOfOne().work, PlannedWork::install);
}

TEST_F(SyncPlan, ResumesInstallOfDemotedApp) {
  libraryHas("org.a", "1.0");
  deviceAwaits("org.a");
  apps_["org.a"].installType = platform::TSInstallType::Downgrade;
  apps_["org.a"].isUnderWay = true;
  EXPECT_EQ(planOfOne().work, PlannedWork::install);
}

TEST_F(SyncPlan, StoreDeliversRestoredApp) {
  libraryHas("org.a", "1.0");
  deviceAwaits("org.a");
  fromStore_ = {"org.a"};
  EXPECT_EQ(planOfOne().work, PlannedWork::restore);
  only_ = {"org.a"};
  EXPECT_EQ(planOfOne().work, PlannedWork::restore);
  only_ = {"org.b"};
  EXPECT_EQ(planOfOne().work, PlannedWork::refuse);  // org.b itself
  only_ = {};
  remove_ = {"org.a"};
  EXPECT_EQ(planOfOne().work, PlannedWork::remove);
}

TEST_F(SyncPlan, InstallsRestoredAppOrReportsMissingPackage) {
  deviceAwaits("org.a");
  apps_["org.a"].installType = platform::TSInstallType::Restore;
  EXPECT_EQ(planOfOne().work, PlannedWork::refuse);
  libraryHas("org.a", "1.0");
  EXPECT_EQ(planOfOne().work, PlannedWork::install);
}

}  // namespace
}  // namespace appsync::host
