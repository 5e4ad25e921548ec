// The placeholder of an app that is about to be installed through a coordinator.
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "tests/coordination/CoordinationFixture.h"

namespace appsync::test {
namespace {

using platform::TransactionPhase;
using platform::TransactionStep;

class CoordinatedPlaceholder : public CoordinationFixture {
 protected:
  void SetUp() override {
    CoordinationFixture::SetUp();
    platform.coordination.add(FakeCoordinator::of("com.a").withOptions({}).withoutODRAssets().withAppAsset({}));
  }

  bool prepare() { return makeTracedClient().prepareAppForInstallUsingCoordination(asset, false); }

  [[nodiscard]] FakePlaceholder placeholder() const { return platform.coordination.placeholder("com.a").value(); }

  [[nodiscard]] std::string copied(const std::optional<Error>& failure, std::uint64_t size) const {
    return "Copied icon from " + std::string(kStagedIcon) + " to " + std::string(kPlaceholderIcon) + " with error " +
           description(failure) + " for 'com.a', sizeOnDisk:" + std::to_string(size);
  }

  [[nodiscard]] bool iconStepSucceeded() const {
    return platform.journal.count("transactionLog.logStep 5 com.a y Copying icon") == 2;
  }

  const Error denied{"POSIX", 13, "Permission denied", nullptr};
};

TEST_F(CoordinatedPlaceholder, AnIconThatCannotBeCopiedLeavesThePlaceholderWithoutOneAndConfigured) {
  platform.files.failures.failNext(FileOperation::copyItem, kStagedIcon, denied);
  EXPECT_TRUE(prepare());
  EXPECT_EQ(placeholder().icon, nullptr);
  EXPECT_TRUE(placeholder().isConfigured);
  EXPECT_TRUE(placeholder().attributes);
  EXPECT_TRUE(placeholder().metadata);
  EXPECT_TRUE(said(copied(denied, 0)));
  EXPECT_FALSE(said("icon for com.a at " + std::string(kPlaceholderIcon) + " has a size of 0"));
  EXPECT_TRUE(iconStepSucceeded());
  EXPECT_TRUE(said("processing app install for bundle com.a finished with status 1 error " + description(denied)));
}

TEST_F(CoordinatedPlaceholder, AnIconOfUnknownSizeIsNone) {
  platform.files.failures.failNext(FileOperation::attributesOfItem, kPlaceholderIcon, denied);
  EXPECT_TRUE(prepare());
  EXPECT_EQ(placeholder().icon, nullptr);
  EXPECT_TRUE(placeholder().isConfigured);
  EXPECT_TRUE(said("icon for com.a at " + std::string(kPlaceholderIcon) + " has a size of 0"));
  EXPECT_TRUE(said(copied(std::nullopt, 0)));
}

TEST_F(CoordinatedPlaceholder, AnEmptyIconFileIsNone) {
  platform.files.put(kStagedIcon, "");
  EXPECT_TRUE(prepare());
  EXPECT_EQ(placeholder().icon, nullptr);
  EXPECT_TRUE(placeholder().isConfigured);
}

TEST_F(CoordinatedPlaceholder, AnIconThatAnEarlierPlaceholderLeftIsReplaced) {
  platform.files.put(kPlaceholderIcon, "the icon of an older version");
  EXPECT_TRUE(prepare());
  ASSERT_NE(placeholder().icon, nullptr);
  EXPECT_EQ(placeholder().icon->diskSpaceNeeded, 9U);
  EXPECT_EQ(platform.files.text(kPlaceholderIcon), "a picture");
  EXPECT_TRUE(said(copied(std::nullopt, 9)));
}

TEST_F(CoordinatedPlaceholder, AnAssetWithoutAnIconCopiesNone) {
  asset.setIcon(std::nullopt);
  EXPECT_TRUE(prepare());
  EXPECT_EQ(platform.journal.count("transactionLog.logStep 5"), 0U);
  EXPECT_EQ(platform.journal.count("fileSystem.copyItem"), 0U);
  EXPECT_TRUE(placeholder().isConfigured);
}

TEST_F(CoordinatedPlaceholder, WithoutAFolderThePlaceholderHasNoIcon) {
  platform.files.failures.failNext(FileOperation::createDirectory, kPlaceholderFolder, denied);
  EXPECT_TRUE(prepare());
  EXPECT_EQ(platform.journal.count("transactionLog.logStep 5"), 0U);
  EXPECT_EQ(placeholder().icon, nullptr);
  EXPECT_TRUE(placeholder().isConfigured);
  EXPECT_EQ(platform.transactions.scenarios(),
            (std::vector{ScenarioEntry{"Harvo App Restore", Success::no, "com.a", "Failed to create app directory"}}));
}

TEST_F(CoordinatedPlaceholder, AnIconThatCannotBeAttachedLeavesThePlaceholderUnconfiguredAndHandedOver) {
  platform.coordination.failures.failNext("placeholder.setIconPromise", "com.a", error);
  EXPECT_TRUE(prepare());
  EXPECT_TRUE(placeholder().isAttached);
  EXPECT_FALSE(placeholder().isConfigured);
  EXPECT_EQ(placeholder().attributes, std::nullopt);
  EXPECT_EQ(placeholder().metadata, std::nullopt);
  EXPECT_EQ(platform.coordination.promise("com.a-Icon")->cancellation,
            (FakeCancellation{{"ZTError", 30, {}, nullptr}, kSync}));
  EXPECT_TRUE(said("added placeholder promise to coordinator for com.a"));
}

TEST_F(CoordinatedPlaceholder, AnIconPromiseThatCannotBeMadeDoesTheSame) {
  platform.coordination.failures.failNext("installCoordination.makePromisedTransferToPath", "com.a-Icon", error);
  EXPECT_TRUE(prepare());
  EXPECT_TRUE(placeholder().isAttached);
  EXPECT_FALSE(placeholder().isConfigured);
}

TEST_F(CoordinatedPlaceholder, WithoutAPlaceholderNoIconIsPromisedAndTheInstallIsGivenUp) {
  platform.coordination.failures.failNext("installCoordination.initAppPlaceholder", "com.a", error);
  EXPECT_FALSE(prepare());
  EXPECT_EQ(platform.journal.count("installCoordination.makePromisedTransferToPath"), 0U);
  EXPECT_FALSE(complained("Placeholder to add icon promise is nil for 'com.a'"));
  EXPECT_TRUE(platform.journal.contains("coordinator.setPlaceholderPromise com.a none"));
  EXPECT_FALSE(said("Cancelling placeholder for appBundleIdentifier:com.a"));
  EXPECT_TRUE(said("Cancelling coordinator for appBundleIdentifier:com.a"));
}

struct ConfigurationFailure {
  const char* operation;
  const char* complaint;
  std::vector<std::string> taken;
};

TEST_F(CoordinatedPlaceholder, AFailedConfigurationEndsThereAndIsTolerated) {
  const std::vector<ConfigurationFailure> failures{
      {"placeholder.setPlaceholderAttributes",
       "setting attributes on placeholder for 'com.a'",
       {"placeholder.setPlaceholderAttributes com.a"}},
      {"placeholder.setMetadata",
       "setting store metadata on placeholder for 'com.a'",
       {"placeholder.setPlaceholderAttributes com.a", "placeholder.setMetadata com.a none"}},
      {"placeholder.setConfigurationComplete",
       "setting placeholder configuration as complete for 'com.a'",
       {"placeholder.setPlaceholderAttributes com.a", "placeholder.setMetadata com.a none",
        "placeholder.setConfigurationComplete com.a"}},
  };
  asset.setIcon(std::nullopt);
  for (const ConfigurationFailure& failure : failures) {
    SCOPED_TRACE(failure.operation);
    platform.log.clear();
    platform.coordination.failures.failNext(failure.operation, "com.a", error);
    EXPECT_TRUE(prepare());
    EXPECT_TRUE(complained("Error " + description(error) + " " + failure.complaint));
    EXPECT_EQ(platform.journal.lines({"placeholder."}), failure.taken);
    EXPECT_TRUE(placeholder().isAttached);
    EXPECT_FALSE(placeholder().isConfigured);
    EXPECT_TRUE(said("processing app install for bundle com.a finished with status 1 error " + description(error)));
    platform.coordination.cancelByUser("com.a");
    platform.coordination.waitUntilIdle();
    platform.coordination.add(FakeCoordinator::of("com.a").withOptions({}).withoutODRAssets().withAppAsset({}));
  }
}

}  // namespace
}  // namespace appsync::test
