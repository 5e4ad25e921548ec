// Coordinators of a reopened device, in either mode.
#include <filesystem>

#include <gmock/gmock.h>

#include "tests/device/coordination/ServiceFixture.h"

namespace appsync::test {
namespace {

using platform::TSInstallPhase;
using platform::TSInstallState;
using platform::TSInstallType;
using testing::IsEmpty;

class CoordinationRestart : public CoordinationTest {
 protected:
  std::shared_ptr<platform::PromisedOutOfBandTransfer> userData() {
    return service().makePromisedOutOfBandTransfer("com.a-UserData", kSync, 5);
  }
  /// Makes a coordinator with a delivered package, which waits for user data.
  std::shared_ptr<platform::InstallCoordinator> prepareWithUserData(const platform::FileLocation& package,
                                                                    Kind kind = Kind::initiating) {
    auto coordinator = client_.prepare("com.a", kind);
    EXPECT_TRUE(coordinator->setUserDataPromise(userData()).ok());
    CoordinationClient::deliver(coordinator, package);
    return coordinator;
  }
  /// Leaves the state after a crash when the last promise was fulfilled.
  void completeInDatabase() {
    auto database = device::Database::open(device_.path() + "/device.db", device::Access::exclusive);
    ASSERT_TRUE(database.ok());
    device::Database::Session session(**database);
    ASSERT_TRUE(session.run("delete from coordinator_promises where role = 1").ok());
  }
  [[nodiscard]] std::int64_t rowsIn(const std::string& table) {
    device::Database::Session session(device_.services().database());
    auto query = session.prepare("select count(*) from " + table);
    return query.next() ? query.integer(0) : -1;
  }
};

}  // namespace

TEST_F(CoordinationRestart, KeepsEverySetting) {
  const auto before = client_.prepare("com.a");
  ASSERT_TRUE(before->setUserDataPromise(userData()).ok());
  before->appAssetPromise()->setTransferPath({"/var/mobile/x.zip"});
  before->appAssetPromise()->setPercentComplete(0.625);
  device_.reopen();
  const auto coordinator = client_.find("com.a");
  ASSERT_NE(coordinator, nullptr);
  EXPECT_TRUE(coordinator->hasInstallOptions());
  EXPECT_TRUE(coordinator->hasInitialODRAssetPromises());
  EXPECT_TRUE(coordinator->hasUserDataPromise());
  EXPECT_TRUE(coordinator->hasPlaceholderPromise());
  const auto promise = coordinator->appAssetPromise();
  ASSERT_NE(promise, nullptr);
  EXPECT_EQ(promise->name(), "com.a-Asset");
  EXPECT_EQ(promise->client(), kSync);
  EXPECT_EQ(promise->transferPath(), (platform::FileLocation{"/var/mobile/x.zip"}));
  EXPECT_EQ(promise->percentComplete(), 0.625);
  EXPECT_FALSE(promise->isComplete());
}

TEST_F(CoordinationRestart, KeepsResponsibleClient) {
  ASSERT_TRUE(client_.make("com.a", Kind::restoring)->setAppAssetPromiseResponsibleClient(kStore).ok());
  device_.reopen();
  EXPECT_EQ(client_.find("com.a")->appAssetPromiseResponsibleClient(nullptr), kStore);
}

TEST_F(CoordinationRestart, KeepsPlaceholderWithWaitingInstall) {
  const auto before = client_.prepare("com.a");
  before->appAssetPromise()->setPercentComplete(0.5);
  const std::string container = *device_.record("com.a")->bundleContainerPath();
  device_.reopen();
  EXPECT_EQ(state("com.a"), "0.9 placeholder");
  EXPECT_EQ(device_.record("com.a")->bundleContainerPath(), container);
  const auto progress = device_.record("com.a")->installProgress();
  ASSERT_NE(progress, nullptr);
  EXPECT_EQ(progress->installState(), TSInstallState::Waiting);
  EXPECT_EQ(progress->installPhase(), TSInstallPhase::Loading);
  EXPECT_EQ(progress->completedUnitCount(), 500);
}

TEST_F(CoordinationRestart, ResumesIncompleteCoordinator) {
  static_cast<void>(client_.prepare("com.a"));
  device_.reopen();
  const auto connection = listen(delegate_);
  CoordinationClient::deliver(client_.find("com.a"), stage("com.a"));
  client_.settle();
  EXPECT_EQ(state("com.a"), "1.0");
  EXPECT_THAT(delegate_.reports(), testing::ElementsAre("completed com.a"));
}

TEST_F(CoordinationRestart, InstallsReadyAppsAtOnce) {
  const auto package = stage("com.a");
  prepareWithUserData(package);
  device_.close();
  completeInDatabase();
  device_.reopen();
  client_.settle();
  EXPECT_EQ(state("com.a"), "1.0");
  EXPECT_EQ(client_.find("com.a"), nullptr);
  EXPECT_FALSE(exists(package));
}

TEST_F(CoordinationRestart, EndsCoordinatorWithoutItsPackage) {
  device_.install("com.a", "0.5");
  prepareWithUserData(stage("com.a"), Kind::updating);
  device_.close();
  completeInDatabase();
  std::filesystem::remove(device_.host("/var/mobile/Media/PublicStaging/com.a.zip"));
  device_.reopen();
  client_.settle();
  EXPECT_EQ(state("com.a"), "0.5");
  EXPECT_EQ(client_.find("com.a"), nullptr);
  EXPECT_EQ(device_.registry().lastInstallFailure("com.a")->code, ENOENT);
}

TEST_F(CoordinationRestart, KeepsPromiseWithdrawn) {
  const auto coordinator = client_.prepare("com.a");
  ASSERT_TRUE(coordinator->appAssetPromise()->cancelForReason(kEnough, kSync).ok());
  device_.reopen();
  CoordinationClient::deliver(client_.find("com.a"), stage("com.a"));
  client_.settle();
  EXPECT_EQ(state("com.a"), "0.9 placeholder");
}

TEST_F(CoordinationRestart, RecreatesPlaceholderWithLostFiles) {
  auto placeholder = service().initAppPlaceholder("Notes", "com.a", TSInstallType::Sync, kSync);
  auto attributes = platform::PlaceholderAttributes::initWithInfoPlistDictionary({{"UIPeriodixApp", true}});
  attributes.setBundleVersion("3");
  attributes.setLaunchProhibited(true);
  ASSERT_TRUE(placeholder->setPlaceholderAttributes(attributes).ok());
  ASSERT_TRUE(placeholder->setMetadata(platform::StoreMetadata::initWithDictionary({{"title", "N"}})).ok());
  ASSERT_TRUE(placeholder->setSinfData(bytesOf("licence")).ok());
  ASSERT_TRUE(placeholder->setConfigurationComplete().ok());
  ASSERT_TRUE(client_.make("com.a")->setPlaceholderPromise(placeholder).ok());
  const std::string info = device_.host(*device_.record("com.a")->bundlePath()) + "/Info.plist";
  const std::string before = readHostFile(info);
  device_.close();
  writeHostFile(info, "");  // As after a loss of power.
  device_.reopen();
  EXPECT_EQ(state("com.a"), "3 placeholder");
  EXPECT_EQ(readHostFile(device_.host(*device_.record("com.a")->bundlePath()) + "/Info.plist"), before);
  EXPECT_EQ(textOf(**device_.registry().licenceData("com.a")), "licence");
  EXPECT_EQ(device_.containers(), 1);
  EXPECT_TRUE(device_.files().fileExists(*device_.record("com.a")->bundleContainerPath() + "/HarvoMetadata.plist"));
}

TEST_F(CoordinationRestart, DeletesRowsOfEndedCoordinators) {
  ASSERT_TRUE(client_.prepare("com.a")->cancelForReason(kEnough, kSync).ok());
  CoordinationClient::deliver(client_.prepare("com.b"), stage("com.b"));
  client_.settle();
  for (const char* table : {"coordinators", "coordinator_promises", "coordinator_placeholders", "spent_packages"}) {
    EXPECT_EQ(rowsIn(table), 0) << table;
  }
  device_.reopen();
  EXPECT_THAT(*service().list(), IsEmpty());
}

TEST_F(CoordinationRestart, RemovesSyncPlaceholdersWithoutCoordinator) {
  static_cast<void>(client_.prepare("com.a"));
  device_.placeholder("com.b");
  device_.reopen();
  EXPECT_EQ(state("com.a"), "0.9 placeholder");
  EXPECT_EQ(state("com.b"), "none");
}

TEST_F(CoordinationRestart, RemovesSpentPackageUnlessPathIsReused) {
  const auto spent = stage("com.b");
  const auto needed = stage("com.a");
  prepareWithUserData(needed);
  {
    device::Database::Session session(device_.services().database());
    for (const auto& package : {spent, needed})
      ASSERT_TRUE(session.run("insert into spent_packages values (?)", package.path).ok());
  }
  device_.reopen();
  EXPECT_FALSE(exists(spent));
  EXPECT_TRUE(exists(needed));
  EXPECT_EQ(rowsIn("spent_packages"), 0);
}

TEST_F(CoordinationRestart, EndsCoordinatorsOfSyncsWhileOff) {
  device_.install("com.b");
  const auto package = stage("com.a");
  prepareWithUserData(package);
  ASSERT_TRUE(client_.make("com.b", Kind::restoring)
                  ->setPlaceholderPromise(client_.placeholder("com.b", "B", TSInstallType::Restore))
                  .ok());
  ASSERT_TRUE(device_.services().settings().assign("coordination=off").ok());
  device_.reopen();
  EXPECT_EQ(state("com.a"), "none");
  EXPECT_EQ(state("com.b"), "1.0");
  EXPECT_FALSE(exists(package));
  EXPECT_EQ(device_.containers(), 1);
  EXPECT_THAT(*service().list(), IsEmpty());
  ASSERT_TRUE(device_.services().settings().assign("coordination=on").ok());
  device_.reopen();
  EXPECT_THAT(*service().list(), IsEmpty());
}

TEST_F(CoordinationRestart, KeepsCoordinatorsOfOtherClientsWhileOff) {
  CoordinationClient store(device_, kStore);
  static_cast<void>(store.prepare("com.a"));
  ASSERT_TRUE(device_.services().settings().assign("coordination=off").ok());
  device_.reopen();
  EXPECT_EQ(state("com.a"), "0.9 placeholder");
  ASSERT_TRUE(device_.services().settings().assign("coordination=on").ok());
  device_.reopen();
  CoordinationClient::deliver(store.find("com.a"), stage("com.a"));
  store.settle();
  EXPECT_EQ(state("com.a"), "1.0");
}

TEST_F(CoordinationRestart, CreatesMissingTables) {
  device_.install("com.a");
  device_.close();
  {
    auto database = device::Database::open(device_.path() + "/device.db", device::Access::exclusive);
    ASSERT_TRUE(database.ok());
    device::Database::Session session(**database);
    ASSERT_TRUE(session
                    .runScript("drop table coordinator_promises; drop table coordinator_placeholders; "
                               "drop table coordinators; drop table spent_packages; delete from settings")
                    .ok());
  }
  {
    const auto reader = device::Device::open(device_.path(), device::Access::readOnly);
    ASSERT_TRUE(reader.ok()) << reader.error().text;
    EXPECT_THAT(*(*reader)->services().installCoordination().list(), IsEmpty());
  }
  device_.reopen();
  EXPECT_FALSE(service().coordinationIsEnabled());
  EXPECT_EQ(state("com.a"), "1.0");
  ASSERT_TRUE(device_.services().settings().assign("coordination=on").ok());
  device_.reopen();
  CoordinationClient::deliver(client_.prepare("com.b"), stage("com.b"));
  client_.settle();
  EXPECT_EQ(state("com.b"), "1.0");
}

}  // namespace appsync::test
