// A coordinated install, update, cancellation or removal can be resumed after a crash at any fault point.
#include <string>

#include "tests/device/coordination/ServiceFixture.h"
#include "tests/support/KilledDevice.h"

namespace appsync::test {
namespace {

using Kind = platform::CoordinatorKind;

constexpr auto kMode = device::InstallMode::coordinated;
const platform::FileLocation kPackage{"/var/mobile/Media/PublicStaging/a.zip"};

void stagePackage(TestDevice& device, std::string_view version) {
  device.stage("a.zip", appPackage("com.a", version));
}

/// Checks that the state of the app is consistent, and returns it.
std::string consistentState(TestDevice& device) {
  CoordinationClient client(device);
  std::string state = versionOf(device, "com.a");
  const auto coordinator = client.find("com.a");
  const bool isPromised = coordinator != nullptr && coordinator->hasPlaceholderPromise();
  EXPECT_EQ(state.ends_with(" placeholder"), isPromised) << state;
  EXPECT_EQ(device.record("com.a") != nullptr && device.record("com.a")->installProgress() != nullptr, isPromised);
  // Ready apps are installed by now.
  if (coordinator != nullptr && coordinator->hasAppAssetPromise()) {
    EXPECT_FALSE(coordinator->appAssetPromise()->isComplete());
  }
  return state;
}

void installTo(TestDevice& device, Kind kind) {
  CoordinationClient client(device);
  CoordinationClient::deliver(client.prepare("com.a", kind), kPackage);
  client.settle();
}

TEST(KilledCoordination, ResumesInstall) {
  killAtEveryStep([](TestDevice& device) { stagePackage(device, "2.0"); },
                  [](TestDevice& device) { installTo(device, Kind::initiating); },
                  [](TestDevice& device) {
                    const std::string state = consistentState(device);
                    const bool isInstalled = state == "2.0";
                    EXPECT_TRUE(isInstalled || state == "none" || state == "0.9 placeholder") << state;
                    EXPECT_EQ(device.files().fileExists(kPackage.path), !isInstalled);
                    if (!isInstalled) installTo(device, Kind::initiating);
                    EXPECT_EQ(consistentState(device), "2.0");
                    EXPECT_EQ(device.containers(), 1);
                  },
                  kMode);
}

TEST(KilledCoordination, UpdateIsAtomic) {
  killAtEveryStep(
      [](TestDevice& device) {
        device.install("com.a", "1.0");
        stagePackage(device, "2.0");
      },
      [](TestDevice& device) { installTo(device, Kind::updating); },
      [](TestDevice& device) {
        const std::string state = consistentState(device);
        EXPECT_TRUE(device.record("com.a")->isInstalled());
        EXPECT_TRUE(state == "1.0" || state == "1.0 placeholder" || state == "2.0") << state;
        EXPECT_EQ(device.files().fileExists(kPackage.path), state != "2.0");
        if (state != "2.0") installTo(device, Kind::updating);
        EXPECT_EQ(consistentState(device), "2.0");
      },
      kMode);
}

TEST(KilledCoordination, FailedInstallLeavesNothing) {
  killAtEveryStep(
      [](TestDevice& device) {
        std::string package = appPackage("com.a", "2.0");
        device.stage("a.zip", package.substr(0, package.size() / 2));
        CoordinationClient client(device);
        static_cast<void>(client.prepare("com.a"));
      },
      [](TestDevice& device) { installTo(device, Kind::initiating); },
      [](TestDevice& device) {
        const std::string state = consistentState(device);
        EXPECT_TRUE(state == "none" || state == "0.9 placeholder") << state;
        EXPECT_EQ(device.files().fileExists(kPackage.path), state != "none");
        if (state != "none") installTo(device, Kind::initiating);
        EXPECT_EQ(consistentState(device), "none");
      },
      kMode);
}

TEST(KilledCoordination, CancellationIsAtomic) {
  killAtEveryStep(
      [](TestDevice& device) {
        device.install("com.a", "1.0");
        stagePackage(device, "2.0");
        CoordinationClient client(device);
        const auto coordinator = client.prepare("com.a", Kind::updating);
        const auto userData = client.service().makePromisedOutOfBandTransfer("data", kSync, 0);
        ASSERT_TRUE(coordinator->setUserDataPromise(userData).ok());
        CoordinationClient::deliver(coordinator, kPackage);
      },
      [](TestDevice& device) {
        if (!CoordinationClient(device).find("com.a")->cancelForReason(kEnough, kSync)) _exit(2);
      },
      [](TestDevice& device) {
        const std::string state = versionOf(device, "com.a");
        const bool isCancelled = CoordinationClient(device).find("com.a") == nullptr;
        EXPECT_EQ(state, isCancelled ? "1.0" : "1.0 placeholder");
        EXPECT_EQ(device.files().fileExists(kPackage.path), !isCancelled);
      },
      kMode);
}

TEST(KilledCoordination, UninstallIsAtomic) {
  killAtEveryStep(
      [](TestDevice& device) {
        device.install("com.a", "1.0");
        static_cast<void>(CoordinationClient(device).prepare("com.a", Kind::updating));
      },
      [](TestDevice& device) {
        CoordinationClient client(device);
        client.service().uninstallApp("com.a", platform::UserConfirmation::skip, [](const auto& error) {
          if (error) _exit(2);
        });
        client.settle();
      },
      [](TestDevice& device) {
        const bool isRemoved = device.services().uninstalledApps().lookupUninstalled()->contains("com.a");
        const std::string state = consistentState(device);
        EXPECT_TRUE(isRemoved ? state == "none" : state.starts_with("1.0")) << state;
      },
      kMode);
}

TEST(KilledCoordination, ResumesInstallAfterRepeatedCrashes) {
  killAtEveryStep(
      [](TestDevice& device) {
        stagePackage(device, "2.0");
        CoordinationClient client(device);
        const auto coordinator = client.prepare("com.a");
        const auto userData = client.service().makePromisedOutOfBandTransfer("data", kSync, 0);
        ASSERT_TRUE(coordinator->setUserDataPromise(userData).ok());
        CoordinationClient::deliver(coordinator, kPackage);
        device.close();
        // The state after a crash when everything is ready.
        auto database = device::Database::open(device.path() + "/device.db", device::Access::exclusive);
        device::Database::Session session(**database);
        ASSERT_TRUE(session.run("delete from coordinator_promises where role = 1").ok());
      },
      [](TestDevice& device) { CoordinationClient(device).settle(); },
      [](TestDevice& device) {
        EXPECT_EQ(consistentState(device), "2.0");
        EXPECT_FALSE(device.files().fileExists(kPackage.path));
      },
      kMode);
}

TEST(KilledCoordination, SwitchToDirectModeIsCrashSafe) {
  killAtEveryStep(
      [](TestDevice& device) {
        CoordinationClient client(device);
        static_cast<void>(client.prepare("com.a"));
        ASSERT_TRUE(device.services().settings().assign("coordination=off").ok());
      },
      [](TestDevice&) {}, [](TestDevice& device) { EXPECT_EQ(versionOf(device, "com.a"), "none"); }, kMode);
}

}  // namespace
}  // namespace appsync::test
