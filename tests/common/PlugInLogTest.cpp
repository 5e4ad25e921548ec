// How the plug-in's messages reach the log.
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "common/PlugInLog.h"
#include "tests/support/ClientFixture.h"

namespace appsync::test {

namespace {

/// Counts how often it is printed.
struct Printed {
  mutable int times = 0;
  [[nodiscard]] std::string description() const {
    ++times;
    return "printed";
  }
};

class PlugInLogTest : public ClientFixture {
 protected:
  const PlugInLog log{platform.framework};
};

}  // namespace

TEST_F(PlugInLogTest, AMessageBeginsWithThePlugInsIdentifierAndABar) {
  log.message("%s|hello %{public}@", std::string("you"));
  const LogLines expected{{8, LogLevel::standard, "com.corvel.qor.Zephtra.AppSync|hello you"}};
  EXPECT_TRUE(sameLines(expected, platform.log.lines()));
}

TEST_F(PlugInLogTest, AnErrorGoesToTheSameCategoryAtErrorLevel) {
  log.error("%s|%d problems", 2);
  const LogLines expected{{8, LogLevel::error, "com.corvel.qor.Zephtra.AppSync|2 problems"}};
  EXPECT_TRUE(sameLines(expected, platform.log.lines()));
}

TEST_F(PlugInLogTest, ASummaryGoesToACategoryOfItsOwnAtDefaultLevel) {
  log.summary("%s|all done");
  const LogLines expected{{14, LogLevel::standard, "com.corvel.qor.Zephtra.AppSync|all done"}};
  EXPECT_TRUE(sameLines(expected, platform.log.lines()));
}

TEST_F(PlugInLogTest, ALookupThatFailsStandsInTheGeneralCategoryWithoutTheIdentifier) {
  log.lookupError("unexpected type for %{public}@", "CorvelID");
  const LogLines expected{{0, LogLevel::error, "unexpected type for CorvelID"}};
  EXPECT_TRUE(sameLines(expected, platform.log.lines()));
}

TEST_F(PlugInLogTest, AMessageWhoseLevelIsOffIsNeitherFormattedNorWritten) {
  const Printed value;
  platform.log.disable(8, LogLevel::standard);
  log.message("%s|%{public}@", value);
  EXPECT_EQ(value.times, 0);
  EXPECT_TRUE(platform.log.lines().empty());
  log.error("%s|%{public}@", value);
  log.summary("%s|%{public}@", value);
  EXPECT_EQ(value.times, 2);
  EXPECT_EQ(platform.log.lines().size(), 2U);
}

TEST_F(PlugInLogTest, AnErrorWhoseLevelIsOffIsNeitherFormattedNorWritten) {
  const Printed value;
  platform.log.disable(8, LogLevel::error);
  log.error("%s|%{public}@", value);
  EXPECT_EQ(value.times, 0);
  EXPECT_TRUE(platform.log.lines().empty());
}

TEST_F(PlugInLogTest, ASummaryWhoseCategoryIsOffIsNeitherFormattedNorWritten) {
  const Printed value;
  platform.log.disable(14, LogLevel::standard);
  log.summary("%s|%{public}@", value);
  EXPECT_EQ(value.times, 0);
  EXPECT_TRUE(platform.log.lines().empty());
}

TEST_F(PlugInLogTest, TheLevelIsAskedForEachMessageAnew) {
  platform.log.disable(8, LogLevel::standard);
  log.message("%s|one");
  platform.log.enable(8, LogLevel::standard);
  log.message("%s|two");
  EXPECT_TRUE(sameLines(LogLines{logged("two")}, platform.log.lines()));
}

TEST_F(PlugInLogTest, AWholeReportWithItsLevelsOffWritesNothing) {
  AppsClient& client = makeClient();
  platform.log.disable(8, LogLevel::standard);
  platform.log.disable(14, LogLevel::standard);
  platform.uninstalledList.add("com.gone");
  const plist::Dictionary report = client.installedAssets();
  EXPECT_EQ(report.find("_Deleted")->array()->size(), 1U);
  EXPECT_TRUE(platform.log.lines().empty());
}

}  // namespace appsync::test
