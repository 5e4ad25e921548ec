#include <gtest/gtest.h>

#include "device/InstallCoordination.h"

namespace appsync::test {
namespace {

TEST(InstallCoordination, IsOff) {
  EXPECT_FALSE(device::InstallCoordination().coordinationIsEnabled());
}

TEST(InstallCoordination, ConnectionsOpenAllTheSameAndOutliveTheService) {
  platform::InstallObserverDelegate delegate;
  const auto observer = device::InstallCoordination().initWithMachServiceName(
      "com.corvel.zeph.xpc.cnappobserverdelegate", {platform::ClientIdentity::CXClientSync}, delegate);
  EXPECT_NE(observer, nullptr);
}

}  // namespace
}  // namespace appsync::test
