// Coordinated installs, updates, cancellations and removals.
#include <filesystem>

#include <gmock/gmock.h>

#include "device/InstallerError.h"
#include "tests/device/CoordinationFixture.h"

namespace appsync::test {
namespace {

using device::CoordinationFailure;
using device::CoordinatorPhase;
using platform::ClientIdentity;
using platform::TSInstallPhase;
using platform::TSInstallState;
using platform::TSInstallType;
using testing::ElementsAre;
using testing::IsEmpty;

class CoordinatedInstall : public CoordinationTest {};

TEST_F(CoordinatedInstall, InstallsWhenThePackageIsThere) {
  const auto connection = listen(delegate_);
  const auto coordinator = client_.prepare("com.a");
  EXPECT_EQ(state("com.a"), "0.9 placeholder");
  const auto package = stage("com.a");
  CoordinationClient::deliver(coordinator, package);
  client_.settle();
  EXPECT_EQ(state("com.a"), "1.0");
  EXPECT_EQ(device_.record("com.a")->installType(), TSInstallType::Sync);
  EXPECT_EQ(device_.record("com.a")->installProgress(), nullptr);
  EXPECT_EQ(client_.find("com.a"), nullptr);
  EXPECT_EQ(coordinator->coordinatorError(), std::nullopt);
  EXPECT_FALSE(exists(package));
  EXPECT_EQ(device_.containers(), 1);
  EXPECT_TRUE(device_.isTidy());
  EXPECT_THAT(delegate_.told(), ElementsAre("placeholder com.a", "completed com.a"));
}

}  // namespace
}  // namespace appsync::test
