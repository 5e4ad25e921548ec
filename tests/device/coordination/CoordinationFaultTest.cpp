// That no step of a coordinated install that fails leaves anything but an app, or the way to it.
#include <atomic>
#include <cerrno>
#include <string>

#include "device/storage/FaultPoint.h"
#include "tests/device/coordination/ServiceFixture.h"
#include "tests/support/KilledDevice.h"

namespace appsync::test {
namespace {

using Kind = platform::CoordinatorKind;

std::atomic<long> stepsUntilFault = 0;

/// Makes one step fail, or all from there on, as long as it lives.
class Fault {
 public:
  enum class Extent { oneStep, allFromThere };

  Fault(long step, Extent extent) {
    stepsUntilFault = step;
    device::setFaultHook(extent == Extent::oneStep
                             ? [](const char*) { return stepsUntilFault.fetch_sub(1) == 1 ? ENOSPC : 0; }
                             : [](const char*) { return stepsUntilFault.fetch_sub(1) <= 1 ? ENOSPC : 0; });
  }
  ~Fault() { device::setFaultHook(nullptr); }
  Fault(const Fault&) = delete;
  Fault& operator=(const Fault&) = delete;

  [[nodiscard]] static bool hasCome() { return stepsUntilFault < 1; }
};

/// What a client does, who cancels when something cannot be set; false when it cannot have a coordinator.
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

/// Lets each step fail in turn; `judge` gets a device that has no fault any more.
void failAtEveryStep(Fault::Extent extent, const std::function<void(TestDevice&)>& judge) {
  TestDevice original(device::InstallMode::coordinated);
  original.install("com.a", "1.0");
  original.close();
  long step = 1;
  for (bool goOn = true; goOn; ++step) {
    TestDevice device(original.path());
    device.reopen();
    CoordinationClient client(device);
    const auto package = device.stage("a.zip", appPackage("com.a", "2.0"));
    {
      const Fault fault(step, extent);
      tryToInstall(client, package);
      goOn = Fault::hasCome();
    }
    judge(device);
    if (testing::Test::HasFailure()) {
      FAIL() << "failed at step " << step;
    }
  }
  EXPECT_GT(step, 40) << "that is too few steps to be all of them";
}

/// Brings a device without faults to the new version.
void bringToTheEnd(TestDevice& device) {
  CoordinationClient client(device);
  if (const auto left = client.find("com.a")) {
    ASSERT_TRUE(left->cancelForReason(kEnough, kSync).ok());
  }
  ASSERT_TRUE(device.record("com.a")->isInstalled());
  ASSERT_TRUE(tryToInstall(client, device.stage("a.zip", appPackage("com.a", "2.0"))));
  EXPECT_EQ(versionOf(device, "com.a"), "2.0");
  EXPECT_EQ(client.find("com.a"), nullptr);
}

TEST(FaultyCoordination, GoesOnInTheSameProcessWhicheverStepFails) {
  failAtEveryStep(Fault::Extent::oneStep, bringToTheEnd);
}

TEST(FaultyCoordination, GoesOnInTheNextProcessWhereverTheDiskBecomesFull) {
  failAtEveryStep(Fault::Extent::allFromThere, [](TestDevice& device) {
    device.reopen();
    CoordinationClient(device).settle();
    EXPECT_TRUE(device.isTidy());
    EXPECT_EQ(containersOfRecords(device), device.containers());
    const std::string state = versionOf(device, "com.a");
    const bool isOnTheWay = CoordinationClient(device).find("com.a") != nullptr;
    EXPECT_TRUE(state == "2.0" || state == "1.0" || (isOnTheWay && state == "1.0 placeholder")) << state;
    bringToTheEnd(device);
    EXPECT_EQ(device.containers(), 1);
  });
}

}  // namespace
}  // namespace appsync::test
