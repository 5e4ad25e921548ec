// After a fault anywhere in a coordinated install, the app is installed or the install can be resumed.
#include <functional>
#include <string>

#include "tests/device/InjectedFault.h"
#include "tests/device/coordination/ServiceFixture.h"
#include "tests/support/KilledDevice.h"

namespace appsync::test {
namespace {

using Kind = platform::CoordinatorKind;

/// Makes a coordinated install, cancelling it if something cannot be set. Returns false if there is no coordinator.
bool tryToInstall(CoordinationClient& client, const platform::FileLocation& package) {
  const auto coordinator = client.make("com.a", Kind::updating);
  if (coordinator == nullptr) return false;
  const auto placeholder = client.placeholder("com.a");
  const bool isPrepared = coordinator->setInstallOptions(CoordinationClient::options()).ok() &&
                          coordinator->setInitialODRAssetPromises({}).ok() &&
                          coordinator->setAppAssetPromise(client.promise("p")).ok() &&
                          coordinator->setPlaceholderPromise(placeholder).ok();
  if (isPrepared) {
    CoordinationClient::deliver(coordinator, package);
  } else {
    coordinator->cancelForReason(kEnough, kSync).ignore();
  }
  client.settle();
  return true;
}

/// Makes each fault point fail in turn; `judge` receives the device without faults.
void failAtEachFaultPoint(InjectedFault::Extent extent, const std::function<void(TestDevice&)>& judge) {
  TestDevice original(device::InstallMode::coordinated);
  original.install("com.a", "1.0");
  original.close();
  long faultPoint = 1;
  for (bool isInjected = true; isInjected; ++faultPoint) {
    TestDevice device(original.path());
    device.reopen();
    CoordinationClient client(device);
    const auto package = device.stage("a.zip", appPackage("com.a", "2.0"));
    {
      const InjectedFault fault(faultPoint, extent);
      tryToInstall(client, package);
      isInjected = InjectedFault::wasInjected();
    }
    judge(device);
    if (testing::Test::HasFailure()) {
      FAIL() << "failed at fault point " << faultPoint;
    }
  }
  EXPECT_GT(faultPoint, 40) << "fault points are missing";
}

/// Installs the new version on a device without faults.
void installNewVersion(TestDevice& device) {
  CoordinationClient client(device);
  if (const auto left = client.find("com.a")) {
    ASSERT_TRUE(left->cancelForReason(kEnough, kSync).ok());
  }
  ASSERT_TRUE(device.record("com.a")->isInstalled());
  ASSERT_TRUE(tryToInstall(client, device.stage("a.zip", appPackage("com.a", "2.0"))));
  EXPECT_EQ(versionOf(device, "com.a"), "2.0");
  EXPECT_EQ(client.find("com.a"), nullptr);
}

TEST(FaultyCoordination, RecoversInSameProcessFromAnyFault) {
  failAtEachFaultPoint(InjectedFault::Extent::one, installNewVersion);
}

TEST(FaultyCoordination, RecoversInNextProcessFromFullDisk) {
  failAtEachFaultPoint(InjectedFault::Extent::allLater, [](TestDevice& device) {
    device.reopen();
    CoordinationClient(device).settle();
    EXPECT_TRUE(device.isTidy());
    EXPECT_EQ(containersOfRecords(device), device.containers());
    const std::string state = versionOf(device, "com.a");
    const bool isOnTheWay = CoordinationClient(device).find("com.a") != nullptr;
    EXPECT_TRUE(state == "2.0" || state == "1.0" || (isOnTheWay && state == "1.0 placeholder")) << state;
    installNewVersion(device);
    EXPECT_EQ(device.containers(), 1);
  });
}

}  // namespace
}  // namespace appsync::test
