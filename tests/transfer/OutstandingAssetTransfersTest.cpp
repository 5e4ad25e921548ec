// Which packages the host is asked for, and with what.
#include <condition_variable>
#include <functional>
#include <mutex>
#include <string>
#include <string_view>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include "core/AppsClient.h"
#include "kit/fakes/SyncFileBuilder.h"
#include "tests/support/ClientFixture.h"

namespace appsync::test {
namespace {

using platform::TSInstallPhase;
using platform::TSInstallState;
using platform::TSInstallType;
using platform::ZTAsset;
using Strings = std::vector<std::string>;

const std::string kWork = "/var/mobile/Library/ApplicationSync/HarvoStuff";
const std::string kIcons = "/var/mobile/Library/ApplicationSync/Icons";
constexpr std::string_view kRestoreStatePath = "/var/mobile/Library/ApplicationSync/RestoreState.plist";

class OutstandingAssetTransfers : public ClientFixture {
 protected:
  void SetUp() override { platform.files.putFolder(kWork); }

  void request(const plist::Array& entries) { platform.files.put(kTodoListPath, binaryForm(entries)); }

  /// An app of the todo list, with the folder that the host stages for it.
  static plist::Value staged(FakeFileSystem& files, const std::string& identifier, const std::string& name) {
    putAppFolder(files, kWork + "/" + identifier, identifier, name);
    return installEntry(identifier, "2.0", "Name from host");
  }

  void savePath(std::string_view identifier, std::string_view version, const plist::Value& path) {
    putPropertyList(platform.files, kRestoreStatePath,
                    plist::Dictionary{{identifier, plist::Dictionary{{version, plist::Dictionary{{"path", path}}}}}});
  }

  platform::Assets outstanding() {
    AppsClient& client = makeClient();
    platform.log.clear();
    return client.outstandingAssetTransfers();
  }

  Strings outstandingIdentifiers() {
    Strings identifiers;
    for (const auto& asset : outstanding())
      identifiers.push_back(asset->identifier());
    return identifiers;
  }

  [[nodiscard]] bool said(std::string_view message) const { return platform.log.contains(logged(message)); }
};

TEST_F(OutstandingAssetTransfers, WithoutTodoListAndPlaceholdersNothingIsWanted) {
  EXPECT_TRUE(outstanding().empty());
  LogLines lines = platform.log.lines();
  // The registry reports on a thread of its own, before the wait is announced or after.
  const LogLine waiting = logged("Waiting for -applicationInstallsArePrioritized:arePaused: to complete...");
  EXPECT_EQ(std::erase(lines, waiting), 1U);
  EXPECT_TRUE(sameLines(
      {loggedIn(14, "outstandingAssetTransfers starting with todoList (null)"), logged("SystemAppPlaceholders ()"),
       loggedIn(14, "outstandingAssetTransfers preExistingPlaceHolders {}, idsWeWant {}"),
       loggedIn(14, "prioritized proxies () paused proxies ()"), logged("No assets currently in progress."),
       logged("signaling semaphore"), logged("Wait completed"),
       logged("Assets already in progress (not returning these): ()"), logged("Assets currently restoring: ()"),
       logged("got no icon sort order from SV")},
      lines));
  EXPECT_TRUE(platform.files.hasFolder(kIcons));
}

TEST_F(OutstandingAssetTransfers, AnAppOfTheTodoListIsPreparedWithEverythingTheHostStaged) {
  request({staged(platform.files, "com.a", "App A")});
  const auto assets = outstanding();
  ASSERT_EQ(assets.size(), 1U);
  const ZTAsset& asset = *assets[0];
  EXPECT_EQ(asset.identifier(), "com.a");
  EXPECT_EQ(asset.dataclass(), "Application");
  EXPECT_EQ(asset.prettyName(), "App A");
  EXPECT_EQ(asset.icon(), platform::FileLocation::file(kIcons + "/com.a.png"));
  EXPECT_EQ(asset.variantOptions(), (plist::Dictionary{{"AssetParts", 1}, {"Version", "2.0"}}));
  EXPECT_EQ(asset.storePlist(), kWork + "/com.a/HarvoMetadata.plist");
  EXPECT_EQ(asset.infoPlist(), kWork + "/com.a/Info.plist");
  EXPECT_FALSE(asset.isRestore());
  EXPECT_EQ(platform.files.text(kIcons + "/com.a.png"), FakePNGEncoders::pngOf("icon of com.a"));
  EXPECT_TRUE(said("Asset com.a (pretty=App A, version=2.0) prepped with icon " + kIcons + "/com.a.png, at " + kWork +
                   "/com.a, meta at " + kWork + "/com.a/HarvoMetadata.plist, info at " + kWork +
                   "/com.a/Info.plist, storePid=0, isRestore=n"));
  EXPECT_TRUE(platform.registry.app("com.a")->isPlaceholder);
  EXPECT_EQ(platform.registry.app("com.a")->installType, TSInstallType::Sync);
}

TEST_F(OutstandingAssetTransfers, TheStepsComeInOrder) {
  request({staged(platform.files, "com.a", "App A")});
  static_cast<void>(outstanding());
  EXPECT_EQ(platform.journal.lines({"restrictions.", "profileConnection.", "registry.enumerate", "registry.addObserver",
                                    "registry.removeObserver", "homeScreen.getFlattened", "fileSystem.removeItem",
                                    "fileSystem.readFile " + kWork + "/App", "iconRenderer.", "syncFramework.download",
                                    "registry.installApplication"}),
            (Strings{"profileConnection.effectiveBoolValueForSetting appInstallationAllowed",
                     "fileSystem.readFile " + std::string(kTodoListPath), "registry.enumerateBundlesOfType 7",
                     "registry.enumerateBundlesOfType 0", "registry.addObserver", "registry.removeObserver",
                     "homeScreen.getFlattenedIconState", "fileSystem.removeItem " + kIcons,
                     "iconRenderer.createHomeScreenIconImage " + kWork + "/com.a",
                     "syncFramework.downloadAssetWithIdentifier com.a",
                     "registry.installApplication com.a /tmp/com.corvel.zeph.Apps/com.a.app"}));
}

TEST_F(OutstandingAssetTransfers, OnlyInstallEntriesCount) {
  request({entry("com.a", "remove"), entry("com.b", "SENT"), entry("com.c", "INSTALLED"), entry("com.d", "unknown"),
           plist::Dictionary{{"identifier", "com.e"}}, plist::Dictionary{{"operation", "install"}}, "install", 7});
  EXPECT_TRUE(outstanding().empty());
}

TEST_F(OutstandingAssetTransfers, AnIdentifierThatLeadsUpwardsIsIgnored) {
  request({installEntry("com.a/../../b")});
  EXPECT_TRUE(outstanding().empty());
  EXPECT_TRUE(said("Ignoring invalid path: com.a/../../b"));
}

TEST_F(OutstandingAssetTransfers, AnIdentifierThatIsANumberIsIgnored) {
  request({plist::Dictionary{{"identifier", 17}, {"operation", "install"}}});
  EXPECT_TRUE(outstanding().empty());
  EXPECT_TRUE(said("Ignoring invalid path: 17"));
}

TEST_F(OutstandingAssetTransfers, AnEntryWithoutAnIdentifierIsIgnored) {
  request({plist::Dictionary{{"operation", "install"}}});
  EXPECT_TRUE(outstanding().empty());
  EXPECT_TRUE(said("Ignoring invalid path: (null)"));
}

TEST_F(OutstandingAssetTransfers, OfTwoEntriesForOneAppTheFirstIsWanted) {
  request({installEntry("com.a", "1"), installEntry("com.a", "2")});
  const auto assets = outstanding();
  ASSERT_EQ(assets.size(), 1U);
  EXPECT_EQ(*assets[0]->variantOptions().find("Version"), plist::Value("1"));
  EXPECT_TRUE(said("com.a already has a placeholder - skipping"));
}

TEST_F(OutstandingAssetTransfers, AnAppInProgressIsNeverReturned) {
  platform.registry.add(FakeApp::placeholder("com.a", TSInstallType::StoreDownload)
                            .withProgress(TSInstallState::Active, TSInstallPhase::Loading));
  platform.registry.setInstallOrder({"com.a"});
  request({installEntry("com.a"), installEntry("com.b")});
  EXPECT_EQ(outstandingIdentifiers(), Strings{"com.b"});
  EXPECT_TRUE(said("Assets already in progress (not returning these): (com.a)"));
}

TEST_F(OutstandingAssetTransfers, ARestoringAppIsStillConsidered) {
  platform.registry.add(FakeApp::placeholder("com.a", TSInstallType::Restore)
                            .withProgress(TSInstallState::Active, TSInstallPhase::Loading));
  platform.registry.setInstallOrder({"com.a"});
  static_cast<void>(outstanding());
  EXPECT_TRUE(said("Assets currently restoring: (com.a)"));
  EXPECT_TRUE(said("Not creating a placeholder app for com.a because we already have one"));
}

TEST_F(OutstandingAssetTransfers, ARestoringAppIsReturned) {
  platform.registry.add(FakeApp::placeholder("com.a", TSInstallType::Restore)
                            .withProgress(TSInstallState::Active, TSInstallPhase::Loading));
  platform.registry.setInstallOrder({"com.a"});
  EXPECT_EQ(outstandingIdentifiers(), Strings{"com.a"});
}

/// Time that ends every wait at once.
class ImpatientClock final : public Clock {
 public:
  [[nodiscard]] TimePoint now() const override { return {}; }
  bool wait(std::condition_variable&, std::unique_lock<std::mutex>&, TimePoint, const std::function<bool()>&) override {
    return false;
  }
};

TEST_F(OutstandingAssetTransfers, AFailedQueryOfRunningInstallsIsOnlyLogged) {
  ImpatientClock impatient;
  platform.registry.reportGate.close();
  platform.use(impatient);
  request({installEntry("com.a")});
  AppsClient& client = makeClient();
  std::thread opener([this] {
    platform.registry.reportGate.waitUntilStopped(1);
    platform.registry.reportGate.open();
  });
  EXPECT_EQ(client.outstandingAssetTransfers().size(), 1U);
  opener.join();
  EXPECT_TRUE(platform.log.contains(loggedError("Failed to get list of assets already in progress!")));
  EXPECT_TRUE(platform.log.contains(loggedError("Failed to get list of assets currently restoring!")));
}

TEST_F(OutstandingAssetTransfers, PackagesAreWantedInTheOrderOfTheirIcons) {
  platform.screen.setFlattenedIconState(Strings{"com.c", "com.x", "com.a"});
  request({installEntry("com.a"), installEntry("com.b"), installEntry("com.c"), installEntry("com.d")});
  EXPECT_EQ(outstandingIdentifiers(), (Strings{"com.c", "com.a", "com.b", "com.d"}));
}

TEST_F(OutstandingAssetTransfers, AnAppThatHasAPlaceholderIsNotReturnedAndGetsNoSecondOne) {
  platform.registry.add(FakeApp::placeholder("com.a"));
  request({installEntry("com.a")});
  EXPECT_TRUE(outstanding().empty());
  EXPECT_TRUE(said("com.a already has a placeholder - skipping"));
  EXPECT_TRUE(said("Not creating a placeholder app for com.a because we already have one"));
  EXPECT_TRUE(platform.registry.installs().empty());
}

TEST_F(OutstandingAssetTransfers, AnInstalledAppGetsAPlaceholderForItsUpdate) {
  platform.registry.add(FakeApp::installed("com.a"));
  request({installEntry("com.a", "2.0")});
  EXPECT_EQ(outstandingIdentifiers(), Strings{"com.a"});
  EXPECT_TRUE(platform.registry.app("com.a")->isInstalled);
  EXPECT_TRUE(platform.registry.app("com.a")->isPlaceholder);
}

TEST_F(OutstandingAssetTransfers, WithInstallationForbiddenAWantedAppIsSkipped) {
  platform.restrictions.set(platform::RestrictionSetting::appInstallationAllowed, platform::RestrictionValue::no);
  request({installEntry("com.a")});
  EXPECT_TRUE(outstanding().empty());
  EXPECT_TRUE(said("skipping com.a - its not a restore and app installation is disabled"));
}

TEST_F(OutstandingAssetTransfers, ASystemAppsPlaceholderIsSkipped) {
  platform.registry.add(FakeApp::placeholder("com.sys").ofType(platform::kApplicationTypeSystem));
  EXPECT_TRUE(outstanding().empty());
  EXPECT_TRUE(said("com.sys is system app placeholder - skipping"));
}

TEST_F(OutstandingAssetTransfers, TheNameFromTheHostServesWhereTheBundleHasNone) {
  request({installEntry("com.a", "1", "From host")});
  EXPECT_EQ(outstanding().at(0)->prettyName(), "From host");
}

TEST_F(OutstandingAssetTransfers, TheIdentifierServesWhereThereIsNoName) {
  request({plist::Dictionary{{"identifier", "com.a"}, {"operation", "install"}},
           plist::Dictionary{{"identifier", "com.b"}, {"operation", "install"}, {"name", 9}}});
  const auto assets = outstanding();
  ASSERT_EQ(assets.size(), 2U);
  EXPECT_EQ(assets[0]->prettyName(), "com.a");
  EXPECT_EQ(assets[1]->prettyName(), "com.b");
  EXPECT_EQ(assets[0]->variantOptions(), (plist::Dictionary{{"AssetParts", 1}}));
}

TEST_F(OutstandingAssetTransfers, WithoutARenderedIconThePackagesArtworkServesUntested) {
  request({installEntry("com.a")});
  EXPECT_EQ(outstanding().at(0)->icon(), platform::FileLocation::file(kWork + "/com.a/HarvoArtwork"));
  EXPECT_TRUE(platform.log.contains(loggedError("couldn't create bundle from URL")));
}

TEST_F(OutstandingAssetTransfers, TheIconFolderIsEmptiedOnEveryCall) {
  platform.files.put(kIcons + "/old.png", "old");
  request({staged(platform.files, "com.a", "App A")});
  static_cast<void>(outstanding());
  EXPECT_FALSE(platform.files.has(kIcons + "/old.png"));
  EXPECT_TRUE(platform.files.has(kIcons + "/com.a.png"));
}

TEST_F(OutstandingAssetTransfers, AnIconFolderThatCannotBeMadeIsLoggedAndTheWorkGoesOn) {
  const Error full{"POSIX", 28, "No space left on device", nullptr};
  platform.files.failures.failAlways(FileOperation::createDirectory, kIcons, full);
  request({staged(platform.files, "com.a", "App A")});
  EXPECT_EQ(outstandingIdentifiers(), Strings{"com.a"});
  EXPECT_TRUE(platform.log.contains(loggedError("Can't create icon scratch dir! " + description(full))));
}

TEST_F(OutstandingAssetTransfers, TheIconFolderIsNotMadeWithoutTheSyncFolderAroundIt) {
  platform.files.erase("/var/mobile/Library/ApplicationSync");
  EXPECT_EQ(outstandingIdentifiers(), Strings());
  EXPECT_FALSE(platform.files.hasFolder(kIcons));
  ASSERT_FALSE(platform.log.messages().empty());
  EXPECT_TRUE(platform.log.messages().back().starts_with("Can't create icon scratch dir! POSIX 2 "));
}

TEST_F(OutstandingAssetTransfers, ATodoListThatCannotBeReadStillLetsPlaceholdersBeConsidered) {
  platform.files.put(kTodoListPath, "no property list {");
  platform.registry.add(FakeApp::placeholder("com.a", TSInstallType::Restore));
  static_cast<void>(outstanding());
  EXPECT_TRUE(platform.log.contains(loggedError("couldn't parse todo list")));
  EXPECT_TRUE(said("Not creating a placeholder app for com.a because we already have one"));
}

TEST_F(OutstandingAssetTransfers, ARestoresPlaceholderIsReturnedWithBothPartsEvenWhereInstallationIsForbidden) {
  platform.restrictions.set(platform::RestrictionSetting::appInstallationAllowed, platform::RestrictionValue::no);
  platform.registry.add(FakeApp::placeholder("com.a", TSInstallType::Restore).withVersion("2.0"));
  const auto assets = outstanding();
  ASSERT_EQ(assets.size(), 1U);
  EXPECT_TRUE(assets[0]->isRestore());
  EXPECT_EQ(assets[0]->variantOptions(), (plist::Dictionary{{"AssetParts", 3}, {"Version", "2.0"}}));
  EXPECT_EQ(assets[0]->storePlist(), "/var/mobile/Containers/Bundle/com.a/HarvoMetadata.plist");
  EXPECT_TRUE(said("Not creating a placeholder app for com.a because we already have one"));
  EXPECT_TRUE(platform.registry.installs().empty());
}

TEST_F(OutstandingAssetTransfers, ARestoreWhosePackageIsOnTheDeviceWantsItsDataOnly) {
  platform.registry.add(FakeApp::placeholder("com.a", TSInstallType::Restore).withVersion("2.0"));
  platform.files.put("/parked/com.a.zip", "package");
  savePath("com.a", "2.0", "/parked/com.a.zip");
  EXPECT_EQ(*outstanding().at(0)->variantOptions().find("AssetParts"), plist::Value(2));
  EXPECT_TRUE(said("Recovered download path for com.a at /parked/com.a.zip"));
}

TEST_F(OutstandingAssetTransfers, ARestoreWhoseParkedPackageIsGoneWantsBothPartsAgain) {
  platform.registry.add(FakeApp::placeholder("com.a", TSInstallType::Restore).withVersion("2.0"));
  savePath("com.a", "2.0", "/parked/com.a.zip");
  EXPECT_EQ(*outstanding().at(0)->variantOptions().find("AssetParts"), plist::Value(3));
  EXPECT_TRUE(said("Download path recovered for com.a but the file is missing: /parked/com.a.zip"));
}

TEST_F(OutstandingAssetTransfers, ASavedPathOfAnotherVersionOrTypeCountsAsNone) {
  platform.registry.add(FakeApp::placeholder("com.a", TSInstallType::Restore).withVersion("2.0"));
  savePath("com.a", "1.0", "/parked/com.a.zip");
  EXPECT_EQ(*outstanding().at(0)->variantOptions().find("AssetParts"), plist::Value(3));
  savePath("com.a", "2.0", 5);
  EXPECT_EQ(*makeClient().outstandingAssetTransfers().at(0)->variantOptions().find("AssetParts"), plist::Value(3));
}

TEST_F(OutstandingAssetTransfers, AnAppThatIsNoRestoreWantsItsPackageEvenWhenOneIsSaved) {
  request({installEntry("com.a", "2.0")});
  platform.files.put("/parked/com.a.zip", "package");
  savePath("com.a", "2.0", "/parked/com.a.zip");
  EXPECT_EQ(*outstanding().at(0)->variantOptions().find("AssetParts"), plist::Value(1));
}

TEST_F(OutstandingAssetTransfers, APlaceholderWithoutBundleOrContainerHasNeitherIconNorMetadata) {
  platform.registry.add(FakeApp::placeholder("com.a", TSInstallType::Restore)
                            .withBundlePath(std::nullopt)
                            .withContainerPath(std::nullopt));
  const auto assets = outstanding();
  ASSERT_EQ(assets.size(), 1U);
  EXPECT_EQ(assets[0]->icon(), std::nullopt);
  EXPECT_EQ(assets[0]->infoPlist(), std::nullopt);
  EXPECT_TRUE(platform.log.contains(loggedError("missing bundlePath")));
}

}  // namespace
}  // namespace appsync::test
