// How many apps there are and what they take.
#include <cstdint>
#include <limits>

#include <gtest/gtest.h>

#include "kit/fakes/CallsInLog.h"
#include "tests/support/ClientFixture.h"

namespace appsync::test {
namespace {

using platform::BundleKind;

class InstalledAssetMetrics : public ClientFixture {
 protected:
  void add(std::string identifier, std::string_view type, std::uint64_t bytes) {
    platform.registry.add(FakeApp::installed(std::move(identifier))
                              .ofType(type)
                              .metByWalksOf(BundleKind::user)
                              .withStaticDiskUsage(bytes));
  }
  [[nodiscard]] static plist::Dictionary metrics(std::uint64_t count, std::uint64_t bytes) {
    return {{"_Count", count}, {"_PhysicalSize", bytes}, {"_PurgeableSize", 0}};
  }
};

TEST_F(InstalledAssetMetrics, CountsUserAppsAndAddsTheirBytesUp) {
  add("com.a", "User", 1000);
  add("com.b", "User", 0);
  add("com.c", "User", 20);
  EXPECT_EQ(makeClient().installedAssetMetrics(), metrics(3, 1020));
}

TEST_F(InstalledAssetMetrics, OneWalkAndOneLineAreAllThatIsDone) {
  add("com.a", "User", 1000);
  add("com.b", "User", 20);
  AppsClient& client = makeClient();
  logCalls(platform);
  static_cast<void>(client.installedAssetMetrics());
  EXPECT_TRUE(
      sameLines({called("registry.enumerateBundlesOfType 1"), logged("found 2 apps using 1020 bytes (0 purgeable)")},
                platform.log.lines()));
}

TEST_F(InstalledAssetMetrics, WithoutUserAppsEverythingIsZeroAndTheLineIsStillLogged) {
  EXPECT_EQ(makeClient().installedAssetMetrics(), metrics(0, 0));
  EXPECT_TRUE(sameLines({logged("found 0 apps using 0 bytes (0 purgeable)")}, platform.log.lines()));
}

TEST_F(InstalledAssetMetrics, ASystemAppNeitherCountsNorAddsBytes) {
  add("com.a", "System", 1000);
  add("com.b", "User", 20);
  EXPECT_EQ(makeClient().installedAssetMetrics(), metrics(1, 20));
}

TEST_F(InstalledAssetMetrics, ATypeInOtherLettersDoesNotCount) {
  for (const char* type : {"user", "USER", "User ", "Users", ""})
    add(std::string("com.") + type, type, 1000);
  EXPECT_EQ(makeClient().installedAssetMetrics(), metrics(0, 0));
}

TEST_F(InstalledAssetMetrics, NothingIsEverPurgeable) {
  add("com.a", "User", std::numeric_limits<std::int64_t>::max());
  add("com.b", "System", 1);
  EXPECT_EQ(*makeClient().installedAssetMetrics().find("_PurgeableSize"), plist::Value(0));
}

TEST_F(InstalledAssetMetrics, APlaceholderIsAnAppOfItsUser) {
  platform.registry.add(FakeApp::placeholder("com.a").withStaticDiskUsage(7));
  EXPECT_EQ(makeClient().installedAssetMetrics(), metrics(1, 7));
}

TEST_F(InstalledAssetMetrics, ABundleThatIsNoAppDoesNotCount) {
  platform.registry.addBundle("com.extension", BundleKind::user);
  EXPECT_EQ(makeClient().installedAssetMetrics(), metrics(0, 0));
}

TEST_F(InstalledAssetMetrics, BytesBeyondWhatCanBeCountedStartAnew) {
  add("com.a", "User", std::numeric_limits<std::uint64_t>::max());
  add("com.b", "User", 3);
  EXPECT_EQ(makeClient().installedAssetMetrics(), metrics(2, 2));
}

TEST_F(InstalledAssetMetrics, BytesBeyondTheSignedRangeAreReportedWhole) {
  constexpr std::uint64_t kBytes = std::uint64_t{1} << 63;
  add("com.a", "User", kBytes);
  EXPECT_EQ(makeClient().installedAssetMetrics(), metrics(1, kBytes));
}

}  // namespace
}  // namespace appsync::test
