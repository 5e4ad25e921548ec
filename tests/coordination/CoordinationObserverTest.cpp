// The connection on which the install-coordination service reports.
#include <cstdint>
#include <set>
#include <string>

#include <gtest/gtest.h>

#include "kit/fakes/TextDiff.h"
#include "tests/support/ClientFixture.h"

namespace appsync::test {

namespace {

class CoordinationObserver : public ClientFixture {};

}  // namespace

TEST_F(CoordinationObserver, TheConnectionReportsThePlugInsOwnCoordinatorsToIt) {
  AppsClient& client = makeDaemonClient();
  client.setupInstallCoordinatorObserver();
  EXPECT_TRUE(sameLines({"installCoordination.initWithMachServiceName com.corvel.zeph.xpc.cnappobserverdelegate"},
                        platform.journal.lines()));
  const auto connections = platform.coordination.connections();
  ASSERT_EQ(connections.size(), 1U);
  EXPECT_EQ(connections[0].clients, std::set{platform::ClientIdentity::CXClientSync});
  EXPECT_EQ(static_cast<std::uint64_t>(*connections[0].clients.begin()), 3U);
  EXPECT_EQ(connections[0].delegate, &client);
  EXPECT_TRUE(platform.log.lines().empty());
}

TEST_F(CoordinationObserver, ASecondSetupOpensNothing) {
  AppsClient& client = makeDaemonClient();
  client.setupInstallCoordinatorObserver();
  client.setupInstallCoordinatorObserver();
  EXPECT_EQ(platform.coordination.connections().size(), 1U);
}

TEST_F(CoordinationObserver, ANewObjectOpensAConnectionOfItsOwn) {
  makeDaemonClient().setupInstallCoordinatorObserver();
  takeClient().reset();
  EXPECT_FALSE(platform.coordination.connections()[0].isOpen);
  makeDaemonClient().setupInstallCoordinatorObserver();
  ASSERT_EQ(platform.coordination.connections().size(), 2U);
  EXPECT_TRUE(platform.coordination.connections()[1].isOpen);
}

TEST_F(CoordinationObserver, OutsideTheDaemonAConnectionGoesWithTheObjectToo) {
  makeClient().setupInstallCoordinatorObserver();
  takeClient().reset();
  EXPECT_FALSE(platform.coordination.connections()[0].isOpen);
}

}  // namespace appsync::test
