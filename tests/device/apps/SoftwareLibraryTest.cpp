#include <memory>
#include <optional>
#include <vector>

#include <gtest/gtest.h>

#include "device/apps/SoftwareLibrary.h"
#include "kit/fakes/FakeAppRegistry.h"
#include "tests/support/ServiceDatabase.h"

namespace appsync::test {
namespace {

using device::Receipt;
using device::SoftwareLibrary;

class SoftwareLibraryTest : public testing::Test {
 protected:
  /// Returns the errors of all completions of a refresh.
  std::vector<std::optional<Error>> refresh() {
    std::vector<std::optional<Error>> completions;
    library.refreshReceipts([&](const std::optional<Error>& error) { completions.push_back(error); });
    return completions;
  }
  std::vector<Receipt> receipts() {
    const auto found = library.receipts();
    EXPECT_TRUE(found);
    return *found;
  }

  CallJournal journal;
  FakeFileSystem files{journal};
  FakeUninstalledAppsList uninstalled{journal};
  FakeAppRegistry registry{journal, files, uninstalled};
  ServiceDatabase<SoftwareLibrary> database;
  SoftwareLibrary library{database, registry};
};

TEST_F(SoftwareLibraryTest, StoresReceiptOfEachInstalledUserApp) {
  registry.add(FakeApp::installed("com.b").withVersion("2.1"));
  registry.add(FakeApp::installed("com.a").withVersion(std::nullopt));
  registry.add(FakeApp::updating("com.c").withVersion("3"));
  registry.add(FakeApp::placeholder("com.d"));
  registry.add(FakeApp::installed("com.e").ofType(platform::kApplicationTypeSystem));
  registry.addBundle("com.f", platform::BundleKind::user);
  EXPECT_EQ(refresh(), std::vector<std::optional<Error>>{std::nullopt});
  EXPECT_EQ(receipts(), (std::vector<Receipt>{{"com.a", std::nullopt}, {"com.b", "2.1"}, {"com.c", "3"}}));
}

TEST_F(SoftwareLibraryTest, RefreshReplacesReceipts) {
  registry.add(FakeApp::installed("com.a"));
  refresh();
  EXPECT_TRUE(registry.uninstallApplication("com.a"));
  registry.add(FakeApp::installed("com.b").withVersion("1"));
  refresh();
  EXPECT_EQ(receipts(), (std::vector<Receipt>{{"com.b", "1"}}));
}

TEST_F(SoftwareLibraryTest, ReceiptsSurviveRestart) {
  registry.add(FakeApp::installed("com.a").withVersion("1"));
  refresh();
  database.reopen();
  EXPECT_EQ(*SoftwareLibrary(database, registry).receipts(), (std::vector<Receipt>{{"com.a", "1"}}));
}

TEST_F(SoftwareLibraryTest, FailedRefreshReportsErrorAndKeepsReceipts) {
  registry.add(FakeApp::installed("com.a").withVersion("1"));
  refresh();
  const auto reader = database.openReadOnly();
  SoftwareLibrary unable(*reader, registry);
  std::vector<std::optional<Error>> completions;
  unable.refreshReceipts([&](const std::optional<Error>& error) { completions.push_back(error); });
  ASSERT_EQ(completions.size(), 1U);
  ASSERT_TRUE(completions.front());
  EXPECT_EQ(completions.front()->domain, device::kSQLiteDomain);
  EXPECT_EQ(receipts(), (std::vector<Receipt>{{"com.a", "1"}}));
}

}  // namespace
}  // namespace appsync::test
