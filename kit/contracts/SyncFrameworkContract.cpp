#include "kit/contracts/SyncFrameworkContract.h"

#include <algorithm>
#include <limits>

#include "kit/fakes/Threads.h"

namespace appsync::test {

GTEST_ALLOW_UNINSTANTIATED_PARAMETERIZED_TEST(SyncFrameworkContract);

TEST_P(SyncFrameworkContract, CategoryDoesNotChange) {
  EXPECT_EQ(&framework().ZTGetLogCategory(8), &framework().ZTGetLogCategory(8));
  EXPECT_NE(&framework().ZTGetLogCategory(8), &framework().ZTGetLogCategory(14));
}

TEST_P(SyncFrameworkContract, EveryNumberHasACategory) {
  for (const int number : {0, 8, 14, -1, std::numeric_limits<int>::max(), std::numeric_limits<int>::min()}) {
    LogCategory& category = framework().ZTGetLogCategory(number);
    category.write(LogLevel::error, "message of " + std::to_string(number));
    const std::vector<std::string> lines = subject().loggedLines();
    ASSERT_FALSE(lines.empty());
    EXPECT_NE(lines.back().find("message of " + std::to_string(number)), std::string::npos) << lines.back();
  }
}

TEST_P(SyncFrameworkContract, MessagesAreLoggedInOrder) {
  LogCategory& category = framework().ZTGetLogCategory(8);
  ASSERT_TRUE(category.isEnabled(LogLevel::standard));
  ASSERT_TRUE(category.isEnabled(LogLevel::error));
  category.write(LogLevel::standard, "first");
  framework().ZTGetLogCategory(14).write(LogLevel::error, "second");
  const std::vector<std::string> lines = subject().loggedLines();
  ASSERT_EQ(lines.size(), 2U);
  EXPECT_NE(lines[0].find("first"), std::string::npos);
  EXPECT_NE(lines[1].find("second"), std::string::npos);
}

TEST_P(SyncFrameworkContract, MessagesOfManyThreadsDoNotMix) {
  runOnThreads(8, [&](std::size_t index) {
    LogCategory& category = framework().ZTGetLogCategory(static_cast<int>(index));
    for (int round = 0; round < 20; ++round)
      category.write(LogLevel::standard, std::string(200, 'x'));
  });
  const std::vector<std::string> lines = subject().loggedLines();
  EXPECT_EQ(lines.size(), 160U);
  EXPECT_TRUE(std::ranges::all_of(
      lines, [](const std::string& line) { return line.find(std::string(200, 'x')) != std::string::npos; }));
}

TEST_P(SyncFrameworkContract, RecoverabilityDoesNotChange) {
  for (const Error& error : {Error{"POSIX", 4, "interrupted", nullptr}, Error{"InstallerError", 1, "damaged", nullptr},
                             Error{"", 0, "", nullptr}}) {
    EXPECT_EQ(framework().ZTIsRecoverableError(error), framework().ZTIsRecoverableError(error)) << error.text;
  }
}

TEST_P(SyncFrameworkContract, AssetIsADownloadOfTheApp) {
  const auto asset = framework().downloadAssetWithIdentifier("com.a", "Application", "A");
  ASSERT_NE(asset, nullptr);
  EXPECT_EQ(asset->identifier(), "com.a");
  EXPECT_EQ(asset->dataclass(), "Application");
  EXPECT_EQ(asset->prettyName(), "A");
  EXPECT_TRUE(asset->isDownload());
}

TEST_P(SyncFrameworkContract, NewAssetIsOtherwiseEmpty) {
  const auto asset = framework().downloadAssetWithIdentifier("com.a", "Application", std::nullopt);
  ASSERT_NE(asset, nullptr);
  EXPECT_EQ(asset->prettyName(), std::nullopt);
  EXPECT_EQ(asset->path(), std::nullopt);
  EXPECT_EQ(asset->icon(), std::nullopt);
  EXPECT_FALSE(asset->isRestore());
  EXPECT_TRUE(asset->variantOptions().empty());
  EXPECT_EQ(asset->completedAssetParts(), 0U);
  EXPECT_EQ(asset->storePID(), 0);
}

TEST_P(SyncFrameworkContract, EveryAssetIsNew) {
  const auto first = framework().downloadAssetWithIdentifier("com.a", "Application", "A");
  const auto second = framework().downloadAssetWithIdentifier("com.a", "Application", "A");
  EXPECT_NE(first, second);
}

}  // namespace appsync::test
