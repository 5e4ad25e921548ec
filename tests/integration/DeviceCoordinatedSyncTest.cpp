// Coordinators in syncs of an embedded device.
#include <memory>
#include <string>
#include <utility>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "tests/integration/DeviceSync.h"

namespace appsync::test {
namespace {

using platform::ClientIdentity;
using platform::CoordinatorKind;
using testing::IsEmpty;
using Package = HostApp::Package;

class CoordinatedDeviceSync : public testing::Test {
 protected:
  [[nodiscard]] device::InstallCoordination& coordination() { return device.services().installCoordination(); }
  [[nodiscard]] std::shared_ptr<platform::InstallCoordinator> coordinator(
      std::string_view identifier, ClientIdentity client = ClientIdentity::CXClientSync,
      platform::IfMissing ifMissing = platform::IfMissing::findNothing) {
    return coordination().coordinatorForApp(CoordinatorKind::initiating, identifier, client, ifMissing, nullptr,
                                            nullptr);
  }
  /// Records the app's coordinator after its transfer was reported.
  void noteCoordinatorOf(std::string identifier) {
    sync.beforeTransfersEnd = [this, identifier = std::move(identifier)] { noted = coordinator(identifier); };
  }

  TestDevice device{device::InstallMode::coordinated};
  DeviceSync sync{device};
  std::shared_ptr<platform::InstallCoordinator> noted;
};

TEST_F(CoordinatedDeviceSync, FailedSyncEndsCoordinatorsWithoutPackage) {
  noteCoordinatorOf("com.stalled");
  sync.run({{"com.a", "1.0"}, {"com.stalled", "1.0", Package::stalled}}, {});
  ASSERT_NE(noted, nullptr);
  const auto error = noted->coordinatorError();
  ASSERT_TRUE(error);
  EXPECT_EQ(error->domain, platform::kZTErrorDomain);
  EXPECT_EQ(error->code, 30);
  EXPECT_THAT(*coordination().list(), IsEmpty());
  EXPECT_EQ(device.record("com.stalled"), nullptr);
  EXPECT_TRUE(device.record("com.a")->isInstalled());
}

TEST_F(CoordinatedDeviceSync, FailedTransferEndsItsCoordinator) {
  noteCoordinatorOf("com.lost");
  sync.run({{"com.lost", "1.0", Package::lost}}, {});
  EXPECT_EQ(noted, nullptr);
  EXPECT_THAT(*coordination().list(), IsEmpty());
  EXPECT_EQ(device.record("com.lost"), nullptr);
}

TEST_F(CoordinatedDeviceSync, LeavesAppsThatTheStoreIsInstalling) {
  ASSERT_NE(coordinator("com.store", ClientIdentity::CXClientBazaarly, platform::IfMissing::create), nullptr);
  EXPECT_THAT(sync.run({{"com.store", "1.0"}}, {}), IsEmpty());
  EXPECT_EQ(sync.todoOperations().at("com.store"), "FAILED");
  ASSERT_EQ(coordination().list()->size(), 1U);
  EXPECT_EQ(coordination().list()->front().creator, ClientIdentity::CXClientBazaarly);
}

TEST_F(CoordinatedDeviceSync, DamagedPackageFailsAndLeavesNothing) {
  sync.run({{"com.damaged", "1.0", Package::damaged}}, {});
  EXPECT_EQ(sync.todoOperations().at("com.damaged"), "FAILED");
  EXPECT_THAT(*coordination().list(), IsEmpty());
  EXPECT_EQ(device.record("com.damaged"), nullptr);
}

}  // namespace
}  // namespace appsync::test
