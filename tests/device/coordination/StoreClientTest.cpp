#include <map>

#include <gmock/gmock.h>

#include "device/coordination/StoreClient.h"
#include "tests/device/coordination/ServiceFixture.h"
#include "tests/support/KilledDevice.h"

namespace appsync::test {
namespace {

using device::StoreClient;
using platform::TSInstallType;
using testing::ElementsAre;
using testing::HasSubstr;
using Kind = platform::CoordinatorKind;

/// A directory of packages, named after their identifiers.
class StoreFolder {
 public:
  void publish(const std::string& identifier, const std::string& version = "1.0") {
    packages_[identifier] = folder_.path(identifier + version);
    writeHostFile(packages_[identifier], appPackage(identifier, version));
  }
  void publishNonsense(const std::string& identifier) {
    packages_[identifier] = folder_.path(identifier);
    writeHostFile(packages_[identifier], "no package");
  }
  void loseFile(const std::string& identifier) { std::filesystem::remove(packages_.at(identifier)); }

  [[nodiscard]] Result<std::string> find(std::string_view identifier) const {
    const auto found = packages_.find(identifier);
    if (found == packages_.end()) return Error::fromErrno(ENOENT, "the store has no package of this app");
    return found->second;
  }

 private:
  TemporaryFolder folder_;
  std::map<std::string, std::string, std::less<>> packages_;
};

/// Sets everything that a restore does, except the package, which the store delivers.
void prepareRestore(CoordinationClient& client, std::string_view identifier, Kind kind = Kind::restoring,
                    TSInstallType type = TSInstallType::Restore) {
  const auto coordinator = client.make(identifier, kind);
  if (!coordinator->hasPlaceholderPromise()) {
    EXPECT_TRUE(coordinator->setPlaceholderPromise(client.placeholder(identifier, "Notes", type)).ok());
  }
  if (kind == Kind::restoring) {
    EXPECT_TRUE(coordinator->setAppAssetPromiseResponsibleClient(kStore).ok());
  }
}

class StoreClientTest : public CoordinationTest {
 protected:
  /// Returns "com.a delivered" or "com.b: reason" for each app, after all deliveries and installs.
  std::vector<std::string> deliver() {
    std::vector<std::string> told;
    {
      StoreClient client(
          service(), device_.files(), [&](std::string_view identifier) { return store_.find(identifier); },
          [&](const device::StoreDelivery& delivery) {
            told.push_back(delivery.identifier + (delivery.failure ? ": " + delivery.failure->text : " delivered"));
          });
      client.wait();
    }
    client_.settle();
    return told;
  }
  [[nodiscard]] std::ptrdiff_t packagesLying() const {
    const std::string folder = device_.host(StoreClient::kPackagesPath);
    return std::filesystem::exists(folder) ? TestDevice::entriesIn(folder) : 0;
  }

  StoreFolder store_;
};

TEST_F(StoreClientTest, DeliversPackagesOfRestoredApps) {
  store_.publish("com.a", "2.0");
  store_.publish("com.b");
  prepareRestore(client_, "com.a");
  prepareRestore(client_, "com.b");
  EXPECT_THAT(deliver(), ElementsAre("com.a delivered", "com.b delivered"));
  EXPECT_EQ(state("com.a"), "2.0");
  EXPECT_EQ(state("com.b"), "1.0");
  EXPECT_EQ(client_.find("com.a"), nullptr);
  EXPECT_EQ(packagesLying(), 0);
}

TEST_F(StoreClientTest, NotifiesObserversOfCreator) {
  store_.publish("com.a");
  const auto observer = listen(delegate_);
  prepareRestore(client_, "com.a");
  deliver();
  EXPECT_THAT(delegate_.reports(), ElementsAre("placeholder com.a", "completed com.a"));
}

TEST_F(StoreClientTest, IgnoresAppsOfOtherClients) {
  store_.publish("com.a");
  const auto coordinator = client_.prepare("com.a");
  EXPECT_THAT(deliver(), ElementsAre());
  EXPECT_EQ(coordinator->appAssetPromise()->percentComplete(), 0);
}

TEST_F(StoreClientTest, MissingPackageLeavesCoordinatorWaiting) {
  prepareRestore(client_, "com.a");
  EXPECT_THAT(deliver(), ElementsAre(HasSubstr("com.a: the store has no package of this app")));
  EXPECT_EQ(state("com.a"), "0.9 placeholder");
  device_.reopen();
  store_.publish("com.a");
  EXPECT_THAT(deliver(), ElementsAre("com.a delivered"));
  EXPECT_EQ(state("com.a"), "1.0");
}

TEST_F(StoreClientTest, ReportsAndRetriesUnreadablePackage) {
  store_.publish("com.a");
  store_.loseFile("com.a");
  prepareRestore(client_, "com.a");
  EXPECT_THAT(deliver(), ElementsAre(HasSubstr("No such file")));
  EXPECT_EQ(packagesLying(), 0);
  store_.publish("com.a");
  EXPECT_THAT(deliver(), ElementsAre("com.a delivered"));
  EXPECT_EQ(state("com.a"), "1.0");
}

TEST_F(StoreClientTest, InvalidPackageFailsInstall) {
  store_.publishNonsense("com.a");
  const auto observer = listen(delegate_);
  prepareRestore(client_, "com.a");
  EXPECT_THAT(deliver(), ElementsAre("com.a delivered"));
  // The placeholder may be reported after the failure.
  EXPECT_THAT(delegate_.reports(), ElementsAre(HasSubstr("placeholder com.a"), HasSubstr("completed com.a: ")));
  EXPECT_EQ(packagesLying(), 0);
}

TEST_F(StoreClientTest, FailureDoesNotStopOtherDeliveries) {
  store_.publish("com.b");
  prepareRestore(client_, "com.a");
  prepareRestore(client_, "com.b");
  EXPECT_THAT(deliver(), ElementsAre(HasSubstr("com.a: "), "com.b delivered"));
  EXPECT_EQ(state("com.b"), "1.0");
}

TEST_F(StoreClientTest, RemovesIncompletePackages) {
  std::filesystem::create_directories(device_.host(StoreClient::kPackagesPath));
  writeHostFile(device_.host(StoreClient::kPackagesPath) + "/com.gone.zip", "half");
  writeHostFile(device_.host(StoreClient::kPackagesPath) + "/com.a.zip", "half");
  store_.publish("com.a");
  prepareRestore(client_, "com.a");
  EXPECT_THAT(deliver(), ElementsAre("com.a delivered"));
  EXPECT_EQ(state("com.a"), "1.0");
  EXPECT_EQ(packagesLying(), 0);
}

TEST_F(StoreClientTest, KeepsInstallTypeAndLicence) {
  store_.publish("com.a");
  const auto coordinator = client_.make("com.a", Kind::restoring);
  const auto placeholder = service().initAppPlaceholder("Notes", "com.a", TSInstallType::Restore, kSync);
  const Bytes licence(4, std::byte{9});
  ASSERT_TRUE(placeholder->setSinfData(licence).ok());
  ASSERT_TRUE(placeholder->setConfigurationComplete().ok());
  ASSERT_TRUE(coordinator->setPlaceholderPromise(placeholder).ok());
  ASSERT_TRUE(coordinator->setAppAssetPromiseResponsibleClient(kStore).ok());
  EXPECT_EQ(device_.registry().licenceData("com.a").value(), licence);
  EXPECT_EQ(device_.record("com.a")->installType(), TSInstallType::Restore);
  deliver();
  EXPECT_EQ(device_.registry().licenceData("com.a").value(), licence);
  EXPECT_EQ(device_.record("com.a")->installType(), TSInstallType::Restore);
  EXPECT_TRUE(device_.record("com.a")->isInstalled());
}

TEST_F(StoreClientTest, IgnoresDemotedApps) {
  store_.publish("com.a");
  prepareRestore(client_, "com.a", Kind::restoringDemoted, TSInstallType::IntentionalDowngrade);
  EXPECT_THAT(deliver(), ElementsAre());
  EXPECT_EQ(state("com.a"), "0.9 placeholder");
}

class DemotedCoordinator : public CoordinationTest {};

TEST_F(DemotedCoordinator, EndsOncePlaceholderIsShown) {
  const auto observer = listen(delegate_);
  prepareRestore(client_, "com.a", Kind::restoringDemoted, TSInstallType::IntentionalDowngrade);
  prepareRestore(client_, "com.b", Kind::restoringDemoted, TSInstallType::Downgrade);
  client_.settle();
  EXPECT_THAT(delegate_.reports(), ElementsAre("placeholder com.a", "placeholder com.b"));
  EXPECT_EQ(client_.find("com.a"), nullptr);
  for (int opening = 0; opening < 2; ++opening) {
    EXPECT_EQ(device_.record("com.a")->installType(), TSInstallType::IntentionalDowngrade);
    EXPECT_EQ(device_.record("com.b")->installType(), TSInstallType::Downgrade);
    EXPECT_EQ(device_.record("com.a")->installProgress(), nullptr);
    device_.reopen();
  }
}

TEST_F(DemotedCoordinator, WaitsForPromisedIcon) {
  const auto coordinator = client_.make("com.a", Kind::restoringDemoted);
  const auto placeholder = service().initAppPlaceholder("Notes", "com.a", TSInstallType::Downgrade, kSync);
  const auto icon = client_.promise("com.a-Icon");
  ASSERT_TRUE(placeholder->setIconPromise(icon).ok());
  ASSERT_TRUE(placeholder->setConfigurationComplete().ok());
  ASSERT_TRUE(coordinator->setPlaceholderPromise(placeholder).ok());
  EXPECT_NE(client_.find("com.a"), nullptr);
  icon->setComplete(true);
  EXPECT_EQ(client_.find("com.a"), nullptr);
  EXPECT_EQ(device_.record("com.a")->installType(), TSInstallType::Downgrade);
}

TEST_F(DemotedCoordinator, InstallsPromisedPackage) {
  const auto coordinator = client_.prepare("com.a", Kind::restoringDemoted);
  EXPECT_NE(client_.find("com.a"), nullptr);
  CoordinationClient::deliver(coordinator, stage("com.a"));
  client_.settle();
  EXPECT_EQ(state("com.a"), "1.0");
}

TEST_F(DemotedCoordinator, CanBeCreatedAgain) {
  prepareRestore(client_, "com.a", Kind::restoringDemoted, TSInstallType::Downgrade);
  prepareRestore(client_, "com.a", Kind::restoringDemoted, TSInstallType::IntentionalDowngrade);
  EXPECT_EQ(device_.record("com.a")->installType(), TSInstallType::IntentionalDowngrade);
  EXPECT_EQ(device_.containers(), 1);
}

TEST_F(DemotedCoordinator, InstallsPackageSentByHost) {
  prepareRestore(client_, "com.a", Kind::restoringDemoted, TSInstallType::Downgrade);
  CoordinationClient::deliver(client_.prepare("com.a"), stage("com.a", "2.0"));
  client_.settle();
  EXPECT_EQ(state("com.a"), "2.0");
}

class ReturningDemotedApp : public DemotedCoordinator {
 protected:
  void SetUp() override {
    DemotedCoordinator::SetUp();
    prepareRestore(client_, "com.a", Kind::restoringDemoted, TSInstallType::IntentionalDowngrade);
    coordinator_ = client_.prepare("com.a");
    ASSERT_NE(device_.record("com.a")->installProgress(), nullptr);
  }
  void expectDemoted() {
    EXPECT_TRUE(device_.record("com.a")->isPlaceholder());
    EXPECT_EQ(device_.record("com.a")->installType(), TSInstallType::IntentionalDowngrade);
    EXPECT_EQ(device_.record("com.a")->installProgress(), nullptr);
  }

  std::shared_ptr<platform::InstallCoordinator> coordinator_;
};

TEST_F(ReturningDemotedApp, StaysDemotedAfterCancellation) {
  ASSERT_TRUE(service().cancelByUser("com.a").ok());
  expectDemoted();
}

TEST_F(ReturningDemotedApp, StaysDemotedAfterRestartAndCancellation) {
  coordinator_.reset();
  device_.reopen();
  ASSERT_TRUE(service().cancelByUser("com.a").ok());
  expectDemoted();
}

TEST_F(ReturningDemotedApp, StaysDemotedWhenCoordinationIsTurnedOff) {
  coordinator_.reset();
  ASSERT_TRUE(device_.services().settings().assign("coordination=off").ok());
  device_.reopen();
  expectDemoted();
}

TEST_F(ReturningDemotedApp, StaysDemotedAfterFailedInstall) {
  CoordinationClient::deliver(coordinator_, stage("com.b", "2.0"));
  client_.settle();
  expectDemoted();
}

TEST(StoreClientKill, NextStoreClientDeliversTheRest) {
  StoreFolder store;
  store.publish("com.a");
  const auto deliver = [&store](TestDevice& device) {
    StoreClient client(
        device.services().installCoordination(), device.files(),
        [&](std::string_view identifier) { return store.find(identifier); }, [](const device::StoreDelivery&) {});
    client.wait();
    ASSERT_TRUE(device.services().installCoordination().waitUntilIdle(std::chrono::minutes(5)));
  };
  killAtEveryStep(
      [](TestDevice& device) {
        CoordinationClient client(device);
        prepareRestore(client, "com.a");
      },
      deliver,
      [&](TestDevice& device) {
        const std::string version = versionOf(device, "com.a");
        EXPECT_TRUE(version == "1.0" || version == "0.9 placeholder") << version;
        deliver(device);
        EXPECT_EQ(versionOf(device, "com.a"), "1.0");
        const std::string folder = device.host(StoreClient::kPackagesPath);
        EXPECT_TRUE(!std::filesystem::exists(folder) || TestDevice::entriesIn(folder) == 0);
      },
      device::InstallMode::coordinated);
}

}  // namespace
}  // namespace appsync::test
