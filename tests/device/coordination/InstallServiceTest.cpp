// Coordinated installs and updates and their results.
#include <cmath>
#include <filesystem>
#include <thread>

#include <gmock/gmock.h>

#include "device/packages/InstallerError.h"
#include "kit/fakes/Gate.h"
#include "kit/fakes/Threads.h"
#include "tests/device/InjectedFault.h"
#include "tests/device/coordination/ServiceFixture.h"

namespace appsync::test {
namespace {

using device::CoordinationFailure;
using device::InstallerFailure;
using platform::TSInstallPhase;
using platform::TSInstallState;
using platform::TSInstallType;
using testing::ElementsAre;
using testing::IsEmpty;

/// Blocks every install before it makes its container durable.
class HeldInstalls {
 public:
  HeldInstalls() {
    gate().close();
    device::setFaultHook([](const char* name) {
      if (std::string_view(name) == "sync") gate().pass();
      return 0;
    });
  }
  ~HeldInstalls() {
    gate().open();
    device::setFaultHook(nullptr);
  }
  HeldInstalls(const HeldInstalls&) = delete;
  HeldInstalls& operator=(const HeldInstalls&) = delete;

  static void waitFor(std::size_t installs) { gate().waitUntilStopped(installs); }
  static void release() { gate().open(); }

 private:
  static Gate& gate() {
    static Gate held;
    return held;
  }
};

class CoordinatedInstall : public CoordinationTest {};

}  // namespace

// Successful installs.

TEST_F(CoordinatedInstall, InstallsOnceReady) {
  const auto connection = listen(delegate_);
  const auto coordinator = client_.prepare("com.a");
  EXPECT_EQ(state("com.a"), "0.9 placeholder");
  const auto package = stage("com.a");
  CoordinationClient::deliver(coordinator, package);
  client_.settle();
  EXPECT_EQ(state("com.a"), "1.0");
  EXPECT_EQ(device_.record("com.a")->installType(), TSInstallType::Sync);
  EXPECT_EQ(progress("com.a"), nullptr);
  EXPECT_EQ(client_.find("com.a"), nullptr);
  EXPECT_EQ(coordinator->coordinatorError(), std::nullopt);
  EXPECT_FALSE(exists(package));
  EXPECT_EQ(device_.containers(), 1);
  EXPECT_TRUE(device_.isTidy());
  EXPECT_THAT(delegate_.reports(), ElementsAre("placeholder com.a", "completed com.a"));
}

TEST_F(CoordinatedInstall, KeepsOldVersionUsableDuringUpdate) {
  device_.install("com.a", "1.0");
  const HeldInstalls held;
  const auto coordinator = client_.prepare("com.a", Kind::updating);
  EXPECT_EQ(state("com.a"), "1.0 placeholder");
  CoordinationClient::deliver(coordinator, stage("com.a", "2.0"));
  HeldInstalls::waitFor(1);
  EXPECT_EQ(state("com.a"), "1.0 placeholder");
  EXPECT_TRUE(device_.files().fileExists(*device_.record("com.a")->bundlePath() + "/Info.plist"));
  HeldInstalls::release();
  client_.settle();
  EXPECT_EQ(state("com.a"), "2.0");
  EXPECT_EQ(device_.containers(), 1);
}

TEST_F(CoordinatedInstall, ShowsProgressOfPackageThenOfInstall) {
  const HeldInstalls held;
  const auto coordinator = client_.prepare("com.a");
  const auto running = progress("com.a");
  ASSERT_NE(running, nullptr);
  EXPECT_EQ(running->installState(), TSInstallState::Waiting);
  EXPECT_EQ(running->installPhase(), TSInstallPhase::Loading);
  coordinator->appAssetPromise()->setPercentComplete(0.4567);
  EXPECT_EQ(running->installState(), TSInstallState::Active);
  EXPECT_EQ(running->completedUnitCount(), 457);
  EXPECT_EQ(running->totalUnitCount(), 1000);
  CoordinationClient::deliver(coordinator, stage("com.a"));
  HeldInstalls::waitFor(1);
  EXPECT_EQ(running->installState(), TSInstallState::Active);
  EXPECT_EQ(running->installPhase(), TSInstallPhase::Installing);
  HeldInstalls::release();
  client_.settle();
  EXPECT_EQ(running->installState(), TSInstallState::Finished);
}

TEST_F(CoordinatedInstall, TreatsNaNFractionAsZero) {
  const auto promise = client_.promise("p");
  promise->setPercentComplete(0.25);
  promise->setPercentComplete(std::nan(""));
  EXPECT_EQ(promise->percentComplete(), 0);
}

TEST_F(CoordinatedInstall, ShowsProgressFromBeforePlaceholder) {
  const auto coordinator = client_.make("com.a");
  const auto promise = client_.promise("p");
  promise->setPercentComplete(0.5);
  ASSERT_TRUE(coordinator->setAppAssetPromise(promise).ok());
  ASSERT_TRUE(coordinator->setPlaceholderPromise(client_.placeholder("com.a")).ok());
  EXPECT_EQ(progress("com.a")->completedUnitCount(), 500);
}

TEST_F(CoordinatedInstall, InstallsSeveralAppsAtOnce) {
  constexpr std::size_t kApps = 12;
  const HeldInstalls held;
  for (std::size_t index = 0; index < kApps; ++index) {
    const std::string identifier = "com.app" + std::to_string(index);
    CoordinationClient::deliver(client_.prepare(identifier), stage(identifier));
  }
  HeldInstalls::waitFor(device::Coordinators::kInstallsAtOnce);
  HeldInstalls::release();
  client_.settle();
  for (std::size_t index = 0; index < kApps; ++index)
    EXPECT_EQ(state("com.app" + std::to_string(index)), "1.0");
}

TEST_F(CoordinatedInstall, IsThreadSafe) {
  const auto connection = listen(delegate_);
  runOnThreads(8, [&](std::size_t thread) {
    for (int number = 0; number < 5; ++number) {
      const std::string identifier = "com.t" + std::to_string(thread) + "." + std::to_string(number);
      CoordinationClient client(device_);
      const auto coordinator = client.prepare(identifier);
      switch (number) {
        case 0:
          EXPECT_TRUE(coordinator->cancelForReason(kEnough, kSync).ok());
          break;
        case 1:
          client.service().uninstallApp(identifier, platform::UserConfirmation::skip,
                                        [](const auto& error) { EXPECT_EQ(error, std::nullopt); });
          break;
        default:
          CoordinationClient::deliver(coordinator, stage(identifier));
      }
    }
  });
  client_.settle();
  EXPECT_EQ(device_.registry().apps()->size(), 24U);
  EXPECT_EQ(device_.containers(), 24);
  EXPECT_THAT(*service().list(), IsEmpty());
  EXPECT_EQ(TestDevice::entriesIn(device_.host("/var/mobile/Media/PublicStaging")), 0);
}

TEST_F(CoordinatedInstall, NextProcessInstallsQueuedApps) {
  constexpr std::size_t kApps = 15;
  {
    const HeldInstalls held;
    for (std::size_t index = 0; index < kApps; ++index) {
      const std::string identifier = "com.app" + std::to_string(index);
      CoordinationClient::deliver(client_.prepare(identifier), stage(identifier));
    }
    HeldInstalls::waitFor(device::Coordinators::kInstallsAtOnce);
    const std::jthread closing([this] { device_.close(); });
    HeldInstalls::release();
  }
  device_.reopen();
  client_.settle();
  for (std::size_t index = 0; index < kApps; ++index)
    EXPECT_EQ(state("com.app" + std::to_string(index)), "1.0");
  EXPECT_EQ(TestDevice::entriesIn(device_.host("/var/mobile/Media/PublicStaging")), 0);
}

// Options and metadata.

TEST_F(CoordinatedInstall, UsesStoreMetadataOfOptionsAsDefault) {
  platform::InstallOptions options = CoordinationClient::options(TSInstallType::AutomaticDownload);
  options.setStoreMetadata(platform::StoreMetadata::initWithDictionary({{"itemName", "Notes"}}));
  for (const char* identifier : {"com.a", "com.b"}) {
    ASSERT_TRUE(client_.make(identifier)->setInstallOptions(options).ok());
  }
  CoordinationClient::deliver(client_.prepare("com.a"), stage("com.a"));
  const std::string own = "{itemName = Own;}";
  CoordinationClient::deliver(client_.prepare("com.b"),
                              device_.stage("b.zip", appPackage("com.b", "1.0", {{"HarvoMetadata.plist", own}})));
  client_.settle();
  const auto kept = plist::read(bytesOf(readHostFile(container("com.a") + "/HarvoMetadata.plist")));
  ASSERT_TRUE(kept.ok());
  EXPECT_EQ(kept->find("itemName")->string(), "Notes");
  EXPECT_EQ(readHostFile(container("com.b") + "/HarvoMetadata.plist"), own);
  EXPECT_EQ(device_.record("com.a")->installType(), TSInstallType::AutomaticDownload);
}

TEST_F(CoordinatedInstall, RestoreUsesOptionsOfPlaceholder) {
  const auto coordinator = client_.make("com.a", Kind::restoring);
  ASSERT_TRUE(coordinator->setAppAssetPromise(client_.promise("p")).ok());
  const auto placeholder = service().initAppPlaceholder("Notes", "com.a", TSInstallType::Restore, kSync);
  ASSERT_TRUE(placeholder->setMetadata(platform::StoreMetadata::initWithDictionary({{"title", "N"}})).ok());
  ASSERT_TRUE(placeholder->setSinfData(bytesOf("licence")).ok());
  ASSERT_TRUE(placeholder->setConfigurationComplete().ok());
  ASSERT_TRUE(coordinator->setPlaceholderPromise(placeholder).ok());
  EXPECT_EQ(device_.record("com.a")->installType(), TSInstallType::Restore);
  CoordinationClient::deliver(coordinator, stage("com.a"));
  client_.settle();
  EXPECT_EQ(state("com.a"), "1.0");
  EXPECT_EQ(device_.record("com.a")->installType(), TSInstallType::Restore);
  EXPECT_TRUE(plist::read(bytesOf(readHostFile(container("com.a") + "/HarvoMetadata.plist"))).ok());
  const auto licence = device_.registry().licenceData("com.a");
  ASSERT_TRUE(licence.ok() && licence->has_value());
  EXPECT_EQ(textOf(**licence), "licence");
}

TEST_F(CoordinatedInstall, KeepsPlaceholderForOtherCoordinator) {
  const auto first = client_.prepare("com.a");
  const auto second = client_.prepare("com.a", Kind::updating);
  ASSERT_TRUE(first->cancelForReason(kEnough, kSync).ok());
  EXPECT_EQ(state("com.a"), "0.9 placeholder");
  ASSERT_NE(progress("com.a"), nullptr);
  CoordinationClient::deliver(client_.prepare("com.a"), stage("com.a"));
  client_.settle();
  EXPECT_EQ(state("com.a"), "1.0 placeholder");
  ASSERT_TRUE(second->cancelForReason(kEnough, kSync).ok());
  EXPECT_EQ(state("com.a"), "1.0");
  EXPECT_EQ(device_.containers(), 1);
}

// Failures and cancellation.

TEST_F(CoordinatedInstall, InvalidPackageLeavesNothing) {
  const auto connection = listen(delegate_);
  const std::string whole = appPackage("com.a");
  const std::vector<std::pair<std::string, InstallerFailure>> packages{
      {whole.substr(0, whole.size() / 2), InstallerFailure::damaged},
      {"no package", InstallerFailure::notAPackage},
      {appPackage("com.other"), InstallerFailure::identifierMismatch}};
  for (const auto& [bytes, failure] : packages) {
    const auto coordinator = client_.prepare("com.a");
    const auto running = progress("com.a");
    const auto package = device_.stage("a.zip", bytes);
    CoordinationClient::deliver(coordinator, package);
    client_.settle();
    ASSERT_TRUE(coordinator->coordinatorError().has_value());
    EXPECT_EQ(coordinator->coordinatorError()->code, static_cast<long>(failure));
    EXPECT_EQ(device_.registry().lastInstallFailure("com.a"), coordinator->coordinatorError());
    EXPECT_EQ(running->installState(), TSInstallState::Failed);
    EXPECT_EQ(delegate_.reports().back(), "completed com.a: " + coordinator->coordinatorError()->text);
    EXPECT_EQ(state("com.a"), "none");
    EXPECT_FALSE(exists(package));
    EXPECT_EQ(client_.find("com.a"), nullptr);
  }
  EXPECT_EQ(device_.containers(), 0);
  EXPECT_TRUE(device_.isTidy());
}

TEST_F(CoordinatedInstall, InvalidPackagePathFailsAndRemovesNothing) {
  for (const char* path : {"/var/mobile/Media", "/var/mobile/missing.zip", "/../../etc/passwd", "/", "relative.zip"}) {
    const auto coordinator = client_.prepare("com.a");
    CoordinationClient::deliver(coordinator, {path});
    client_.settle();
    EXPECT_TRUE(coordinator->coordinatorError().has_value()) << path;
    EXPECT_EQ(state("com.a"), "none") << path;
  }
  EXPECT_TRUE(device_.files().fileExists("/var/mobile/Media/PublicStaging"));
  EXPECT_TRUE(std::filesystem::exists("/etc/passwd"));
}

TEST_F(CoordinatedInstall, CompletionWithoutPathFails) {
  const auto coordinator = client_.prepare("com.a");
  coordinator->appAssetPromise()->setComplete(true);
  client_.settle();
  ASSERT_TRUE(coordinator->coordinatorError().has_value());
  EXPECT_EQ(coordinator->coordinatorError()->code, static_cast<long>(CoordinationFailure::noPackage));
}

TEST_F(CoordinatedInstall, RejectsCancellationDuringInstall) {
  const HeldInstalls held;
  const auto coordinator = client_.prepare("com.a");
  CoordinationClient::deliver(coordinator, stage("com.a"));
  HeldInstalls::waitFor(1);
  EXPECT_EQ(failureOf(coordinator->cancelForReason(kEnough, kSync)), CoordinationFailure::installing);
  EXPECT_EQ(failureOf(service().cancelByUser("com.a")), CoordinationFailure::installing);
  EXPECT_EQ(failureOf(coordinator->appAssetPromise()->cancelForReason(kEnough, kSync)),
            CoordinationFailure::installing);
  EXPECT_FALSE(service().waitUntilIdle(std::chrono::milliseconds(0)));
  HeldInstalls::release();
  client_.settle();
  EXPECT_EQ(state("com.a"), "1.0");
}

TEST_F(CoordinatedInstall, CancellationRemovesPackage) {
  device_.install("com.a", "1.0");
  const auto coordinator = client_.prepare("com.a", Kind::updating);
  ASSERT_TRUE(coordinator->setUserDataPromise(service().makePromisedOutOfBandTransfer("d", kSync, 0)).ok());
  const auto package = stage("com.a", "2.0");
  CoordinationClient::deliver(coordinator, package);
  client_.settle();
  EXPECT_TRUE(exists(package));
  ASSERT_TRUE(coordinator->cancelForReason(kEnough, kSync).ok());
  EXPECT_FALSE(exists(package));
  EXPECT_EQ(state("com.a"), "1.0");
  EXPECT_EQ(coordinator->coordinatorError(), kEnough);
  EXPECT_EQ(failureOf(coordinator->cancelForReason(kEnough, kSync)), CoordinationFailure::ended);
}

TEST_F(CoordinatedInstall, FailedCancellationChangesNothing) {
  const auto coordinator = client_.prepare("com.a");
  std::optional<InstalledFaultHook> fault(
      [](const char* name) { return std::string_view(name).starts_with("database") ? ENOSPC : 0; });
  const Status cancelled = coordinator->cancelForReason(kEnough, kSync);
  const auto none = client_.make("com.b");
  fault.reset();
  EXPECT_FALSE(cancelled.ok());
  EXPECT_EQ(none, nullptr);
  EXPECT_EQ(state("com.a"), "0.9 placeholder");
  EXPECT_EQ(coordinator->coordinatorError(), std::nullopt);
  EXPECT_TRUE(coordinator->cancelForReason(kEnough, kSync).ok());
}

}  // namespace appsync::test
