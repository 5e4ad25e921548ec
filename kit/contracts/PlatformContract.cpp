#include "kit/contracts/PlatformContract.h"

#include <array>
#include <memory>

#include "kit/fakes/Threads.h"

namespace appsync::test {

GTEST_ALLOW_UNINSTANTIATED_PARAMETERIZED_TEST(PlatformContract);

namespace {

std::array<const void*, 16> servicesOf(platform::Platform& platform) {
  return {&platform.syncFramework(),
          &platform.sharedInstance(),
          &platform.defaultRegistry(),
          &platform.uninstalledApps(),
          &platform.installCoordination(),
          &platform.homeScreen(),
          &platform.sharedConnection(),
          &platform.transactionLog(),
          &platform.systemLog(),
          &platform.systemNotify(),
          &platform.bundles(),
          &platform.iconRenderer(),
          &platform.pngEncoders(),
          &platform.fileSystem(),
          &platform.clock(),
          &platform.scheduler()};
}

}  // namespace

TEST_P(PlatformContract, ServicesAreTheSameOnEveryThread) {
  const auto services = servicesOf(subject().platform());
  runOnThreads(6, [&](std::size_t) { EXPECT_EQ(servicesOf(subject().platform()), services); });
}

TEST_P(PlatformContract, ConnectionsAreNew) {
  const auto firstManager = subject().platform().makeBackupManager();
  const auto secondManager = subject().platform().makeBackupManager();
  EXPECT_NE(firstManager, nullptr);
  EXPECT_NE(secondManager, nullptr);
  EXPECT_NE(firstManager, secondManager);
  const auto firstLibrary = subject().platform().makeSoftwareLibrary();
  const auto secondLibrary = subject().platform().makeSoftwareLibrary();
  EXPECT_NE(firstLibrary, nullptr);
  EXPECT_NE(secondLibrary, nullptr);
  EXPECT_NE(firstLibrary, secondLibrary);
}

TEST_P(PlatformContract, ConnectionsCanBeMadeOnAnyThread) {
  runOnThreads(6, [&](std::size_t) {
    EXPECT_NE(subject().platform().makeBackupManager(), nullptr);
    EXPECT_NE(subject().platform().makeSoftwareLibrary(), nullptr);
  });
}

}  // namespace appsync::test
