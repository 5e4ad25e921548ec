// Complete syncs with the tool.
#include <filesystem>
#include <fstream>
#include <iterator>

#include <gmock/gmock.h>

#include "device/Device.h"
#include "tests/support/ToolFixture.h"

namespace appsync::test {

namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::UnorderedElementsAre;

class Sync : public ToolFixtureOfEachMode {
 protected:
  /// Adds the placeholder of a restore to an installed app.
  void coverWithPlaceholder(const std::string& identifier) const {
    const auto opened = device::Device::open(device(), device::Access::exclusive);
    ASSERT_TRUE(opened.ok());
    const std::string folder = "/tmp/" + identifier + ".app";
    std::filesystem::create_directories(device() + "/root" + folder);
    write(device() + "/root" + folder + "/Info.plist", infoPlist(identifier, "2.0"));
    const plist::Dictionary options{
        {platform::PackageTypeKey, platform::PackageTypePlaceholder},
        {platform::BundleIdentifierKey, identifier},
        {platform::kInstallTypeKey, static_cast<std::uint64_t>(platform::TSInstallType::Restore)}};
    ASSERT_TRUE((*opened)->platform().defaultRegistry().installApplication({folder, true}, options).ok());
  }
  [[nodiscard]] plist::Dictionary removedApps() const {
    const auto opened = device::Device::open(device(), device::Access::exclusive);
    return (*opened)->platform().uninstalledApps().lookupUninstalled().value();
  }
  [[nodiscard]] static std::string contentOf(const std::string& path) {
    std::ifstream file(path);
    return {std::istreambuf_iterator<char>(file), {}};
  }
};
INSTANTIATE_TEST_SUITE_P(Modes, Sync, kModes, nameOfMode);

TEST_P(Sync, InstallsMissingApps) {
  publish("org.a");
  publish("org.b", "2.1");
  const Finished run = sync();
  EXPECT_EQ(run.status, 0);
  EXPECT_EQ(run.err, "");
  EXPECT_THAT(run.out, HasSubstr("2 installed.\n"));
  EXPECT_THAT(apps(), UnorderedElementsAre("org.a 1.0", "org.b 2.1"));
}

TEST_P(Sync, SecondSyncDoesNothing) {
  publish("org.a");
  ASSERT_EQ(sync().status, 0);
  const Finished run = sync();
  EXPECT_EQ(run.status, 0);
  EXPECT_EQ(run.out, "Nothing to do: 1 up to date.\n");
}

TEST_P(Sync, EmptyLibraryDoesNothing) {
  const Finished run = sync();
  EXPECT_EQ(run.status, 0);
  EXPECT_EQ(run.out, "Nothing to do.\n");
}

TEST_P(Sync, InstallsNewerOfTwoVersions) {
  publish("org.a", "1.9");
  publish("org.a", "1.10");
  EXPECT_EQ(sync().status, 0);
  EXPECT_THAT(apps(), ElementsAre("org.a 1.10"));
}

TEST_P(Sync, UpdatesToNewerVersion) {
  publish("org.a", "1.0");
  ASSERT_EQ(sync().status, 0);
  publish("org.a", "1.1");
  EXPECT_THAT(endsIn(sync({"--json"}).out), ElementsAre("updated org.a"));
  EXPECT_THAT(apps(), ElementsAre("org.a 1.1"));
}

TEST_P(Sync, RemovesNamedApps) {
  publish("org.a");
  publish("org.b");
  ASSERT_EQ(sync().status, 0);
  EXPECT_THAT(endsIn(sync({"--remove", "org.a", "--json"}).out),
              UnorderedElementsAre("removed org.a", "skipped org.b"));
  EXPECT_THAT(apps(), ElementsAre("org.b 1.0"));
}

TEST_P(Sync, DoesNotReinstallRemovedApps) {
  publish("org.a");
  ASSERT_EQ(sync().status, 0);
  ASSERT_EQ(sync({"--remove", "org.a"}).status, 0);
  EXPECT_THAT(endsIn(sync({"--json"}).out), ElementsAre("skipped org.a"));
  EXPECT_THAT(endsIn(sync({"--json"}).out), ElementsAre("skipped org.a"));
  EXPECT_THAT(apps(), IsEmpty());
}

TEST_P(Sync, OnlyReinstallsRemovedApp) {
  publish("org.a");
  ASSERT_EQ(sync().status, 0);
  ASSERT_EQ(sync({"--remove", "org.a"}).status, 0);
  EXPECT_THAT(endsIn(sync({"--only", "org.a", "--json"}).out), ElementsAre("installed org.a"));
  EXPECT_THAT(endsIn(sync({"--json"}).out), ElementsAre("skipped org.a"));
  EXPECT_THAT(apps(), ElementsAre("org.a 1.0"));
}

TEST_P(Sync, OnlyInstallsNothingElse) {
  publish("org.a");
  publish("org.b");
  EXPECT_THAT(endsIn(sync({"--only", "org.b", "--json"}).out), ElementsAre("installed org.b"));
  EXPECT_THAT(apps(), ElementsAre("org.b 1.0"));
}

TEST_P(Sync, OnlyWithoutPackageFails) {
  const Finished run = sync({"--only", "org.c"});
  EXPECT_EQ(run.status, 1);
  EXPECT_THAT(run.err, HasSubstr("org.c failed: the library has no package of this app"));
}

TEST_P(Sync, FailedAppDoesNotStopOthers) {
  publish("org.a");
  write(library() + "/broken.zip", "this is no archive");
  publish("org.b");
  const Finished run = sync({"--json"});
  EXPECT_EQ(run.status, 1);
  EXPECT_EQ(run.err, "");
  EXPECT_THAT(endsIn(run.out), UnorderedElementsAre("failed broken.zip", "installed org.a", "installed org.b"));
}

TEST_P(Sync, FailureHasTheInstallersReason) {
  publish("org.a", "1.0", {{"Notes.app/torn", std::string(5000, 'x'), S_IFREG | 0644, false, true}});
  const Finished run = sync({"--json"});
  EXPECT_EQ(run.status, 1);
  const auto events = eventsIn(run.out);
  ASSERT_GE(events.size(), 2U);
  EXPECT_EQ(events[events.size() - 2].at("event"), "failed");
  EXPECT_THAT(std::string(events[events.size() - 2].at("reason")), HasSubstr("Notes.app/torn"));
  EXPECT_THAT(apps(), IsEmpty());
}

TEST_P(Sync, OffersFailedUpdateAgain) {
  publish("org.a");
  ASSERT_EQ(sync().status, 0);
  publish("org.a", "2.0", {{"Notes.app/torn", "x", S_IFREG | 0644, false, true}});
  ASSERT_EQ(sync().status, 1);
  publish("org.a", "2.0");
  EXPECT_EQ(sync().status, 0);
  EXPECT_THAT(apps(), ElementsAre("org.a 2.0"));
}

/// Flips one byte of an installed app's new package.
TEST_P(Sync, FailedUpdateKeepsTheAppAndItsData) {
  publish("org.a");
  ASSERT_EQ(sync().status, 0);
  const std::string data = device() + "/root/var/mobile/Containers/Data/org.a";
  std::filesystem::create_directories(data);
  write(data + "/notes", "kept");
  publish("org.a", "2.0", {{"Notes.app/content", "flipped", S_IFREG | 0644, false, true}});

  const Finished failed = sync({"--json"});
  EXPECT_EQ(failed.status, 1);
  EXPECT_THAT(endsIn(failed.out), ElementsAre("failed org.a"));
  EXPECT_THAT(failed.out, HasSubstr("Notes.app/content"));
  EXPECT_THAT(apps(), ElementsAre("org.a 1.0"));
  EXPECT_THAT(removedApps(), IsEmpty());
  EXPECT_EQ(contentOf(data + "/notes"), "kept");

  publish("org.a", "2.0");
  EXPECT_THAT(endsIn(sync({"--json"}).out), ElementsAre("updated org.a"));
  EXPECT_THAT(apps(), ElementsAre("org.a 2.0"));
  EXPECT_EQ(contentOf(data + "/notes"), "kept");
}

TEST_P(Sync, RemovalUnderAPlaceholderNeedsAnotherSync) {
  publish("org.a");
  ASSERT_EQ(sync().status, 0);
  coverWithPlaceholder("org.a");

  const Finished first = sync({"--json", "--remove", "org.a"});
  EXPECT_EQ(first.status, 1);
  EXPECT_THAT(endsIn(first.out), ElementsAre("failed org.a"));
  EXPECT_THAT(first.out, HasSubstr("only its placeholder was removed; run the sync again to remove the app"));
  EXPECT_THAT(apps(), ElementsAre("org.a 1.0"));

  EXPECT_THAT(endsIn(sync({"--json", "--remove", "org.a"}).out), ElementsAre("removed org.a"));
  EXPECT_THAT(apps(), IsEmpty());
}

TEST_P(Sync, ClearLeavesAnAppUnderAPlaceholder) {
  publish("org.a");
  ASSERT_EQ(sync().status, 0);
  coverWithPlaceholder("org.a");
  const std::string data = device() + "/root/var/mobile/Containers/Data/org.a";
  std::filesystem::create_directories(data);
  write(data + "/notes", "kept");
  ASSERT_EQ(runTool({"clear", device()}).status, 0);
  EXPECT_THAT(apps(), ElementsAre("org.a 1.0"));
  EXPECT_EQ(contentOf(data + "/notes"), "kept");
}

TEST_P(Sync, SkipsForbiddenInstalls) {
  publish("org.a");
  ASSERT_EQ(runTool({"set", device(), "app-installation=no"}).status, 0);
  const Finished run = sync();
  EXPECT_EQ(run.status, 0);
  EXPECT_THAT(run.out, HasSubstr("installing apps is not allowed on this device (app-installation=no)"));
  EXPECT_THAT(apps(), IsEmpty());
  ASSERT_EQ(runTool({"set", device(), "app-installation=unset"}).status, 0);
  EXPECT_THAT(endsIn(sync({"--json"}).out), ElementsAre("installed org.a"));
}

TEST_P(Sync, SkipsForbiddenRemovals) {
  publish("org.a");
  ASSERT_EQ(sync().status, 0);
  ASSERT_EQ(runTool({"set", device(), "app-removal=no"}).status, 0);
  const Finished run = sync({"--remove", "org.a"});
  EXPECT_EQ(run.status, 0);
  EXPECT_THAT(run.out, HasSubstr("removing apps is not allowed on this device (app-removal=no)"));
  EXPECT_THAT(apps(), ElementsAre("org.a 1.0"));
}

TEST_P(Sync, ForgetsForbiddenRemoval) {
  publish("org.a");
  ASSERT_EQ(sync().status, 0);
  ASSERT_EQ(runTool({"set", device(), "app-removal=no"}).status, 0);
  ASSERT_EQ(sync({"--remove", "org.a"}).status, 0);
  publish("org.a", "1.1");
  EXPECT_THAT(endsIn(sync({"--json"}).out), ElementsAre("updated org.a"));
}

TEST_P(Sync, ReportsEachAppOnce) {
  publish("org.a");
  publish("org.b");
  ASSERT_EQ(sync().status, 0);
  publish("org.b", "2.0");
  publish("org.c");
  write(library() + "/broken.zip", "PK");
  const Finished run = sync({"--json", "--remove", "org.a", "--remove", "org.x"});
  const auto events = eventsIn(run.out);
  ASSERT_FALSE(events.empty());
  EXPECT_THAT(endsIn(run.out), UnorderedElementsAre("removed org.a", "skipped org.x", "updated org.b",
                                                    "installed org.c", "failed broken.zip"));
  EXPECT_EQ(cli::onOneLine(events.back()),
            R"({"event":"summary","installed":["org.c"],"updated":["org.b"],"removed":["org.a"],)"
            R"("failed":["broken.zip"],"skipped":["org.x"]})");
}

TEST_P(Sync, ProgressRisesToOneForEachApp) {
  publish("org.a", "1.0", {{"Notes.app/large", std::string(500'000, 'x')}});
  double last = -1;
  for (const cli::Json& event : eventsIn(sync({"--json"}).out)) {
    if (event.at("event") != "progress") continue;
    EXPECT_GE(event.at("fraction"), last);
    last = event.at("fraction");
  }
  EXPECT_EQ(last, 1.0);
}

TEST_P(Sync, AppendsToTheLog) {
  publish("org.a");
  write(path("log"), "earlier\n");
  ASSERT_EQ(sync({"--log", path("log")}).status, 0);
  std::ifstream file(path("log"));
  const std::string log{std::istreambuf_iterator<char>(file), {}};
  EXPECT_TRUE(log.starts_with("earlier\n"));
  EXPECT_THAT(log, HasSubstr(" 8 default com.corvel.qor.Zephtra.AppSync|getting installed assets\n"));
  EXPECT_THAT(log, HasSubstr("|finished reconcile sync\n"));
}

TEST_P(Sync, LeavesNothingInTheStagingFolder) {
  publish("org.a");
  write(library() + "/broken.zip", "PK");
  ASSERT_EQ(sync().status, 1);
  EXPECT_TRUE(std::filesystem::is_empty(device() + "/root/var/mobile/Media/PublicStaging"));
}

TEST_P(Sync, AddsNewIconsAtTheEnd) {
  publish("org.z");
  ASSERT_EQ(sync().status, 0);
  publish("org.a");
  ASSERT_EQ(sync().status, 0);
  const Finished order =
      runTool({"plist", device() + "/root/var/mobile/Library/ApplicationSync/HarvoStuff/SolvaryIconState.plist", "--to",
               "json"});
  EXPECT_EQ(cli::Json::parse(order.out), cli::Json::array({"org.z", "org.a"}));
}

TEST_P(Sync, ClearForgetsRemovals) {
  publish("org.a");
  ASSERT_EQ(sync().status, 0);
  ASSERT_EQ(sync({"--remove", "org.a"}).status, 0);
  ASSERT_EQ(runTool({"clear", device()}).status, 0);
  EXPECT_THAT(endsIn(sync({"--json"}).out), ElementsAre("installed org.a"));
}

class DirectSync : public ToolFixture {
 protected:
  DirectSync() : ToolFixture("--direct") {}
};

TEST_F(DirectSync, FailingHomeScreenFailsTheApp) {
  publish("org.a");
  ASSERT_EQ(runTool({"set", device(), "assertion=org.a:failing"}).status, 0);
  EXPECT_THAT(endsIn(sync({"--json"}).out), ElementsAre("failed org.a"));
}

TEST_F(DirectSync, FailingHomeScreenKeepsUpdatedApp) {
  publish("org.a");
  ASSERT_EQ(sync().status, 0);
  publish("org.a", "2.0");
  ASSERT_EQ(runTool({"set", device(), "assertion=org.a:failing"}).status, 0);
  EXPECT_THAT(endsIn(sync({"--json"}).out), ElementsAre("failed org.a"));
  EXPECT_THAT(apps(), ElementsAre("org.a 1.0"));
}

}  // namespace

}  // namespace appsync::test
