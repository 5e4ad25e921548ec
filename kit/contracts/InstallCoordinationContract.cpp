#include "kit/contracts/InstallCoordinationContract.h"

#include <thread>

#include "kit/fakes/Threads.h"

namespace appsync::test {

using platform::ClientIdentity;

GTEST_ALLOW_UNINSTANTIATED_PARAMETERIZED_TEST(InstallCoordinationContract);

namespace {

constexpr std::string_view kServiceName = "com.corvel.contract.observer";

}  // namespace

TEST_P(InstallCoordinationContract, EnabledDoesNotChange) {
  const bool isEnabled = subject().coordination().coordinationIsEnabled();
  runOnThreads(4, [&](std::size_t) { EXPECT_EQ(subject().coordination().coordinationIsEnabled(), isEnabled); });
}

TEST_P(InstallCoordinationContract, ConnectionOpensAndCloses) {
  auto connection = subject().coordination().initWithMachServiceName(
      kServiceName, {ClientIdentity::CXClientSync, ClientIdentity::CXClientBazaarly}, delegate);
  EXPECT_NE(connection, nullptr);
  connection.reset();
}

TEST_P(InstallCoordinationContract, ConnectionCanCloseOnAnotherThread) {
  auto connection =
      subject().coordination().initWithMachServiceName(kServiceName, {ClientIdentity::CXClientSync}, delegate);
  ASSERT_NE(connection, nullptr);
  std::jthread([&] { connection.reset(); }).join();
}

TEST_P(InstallCoordinationContract, SeveralConnectionsCanBeOpen) {
  platform::InstallObserverDelegate other;
  const auto first =
      subject().coordination().initWithMachServiceName(kServiceName, {ClientIdentity::CXClientSync}, delegate);
  const auto second =
      subject().coordination().initWithMachServiceName(kServiceName, {ClientIdentity::CXClientSync}, other);
  EXPECT_NE(first, nullptr);
  EXPECT_NE(second, nullptr);
}

}  // namespace appsync::test
