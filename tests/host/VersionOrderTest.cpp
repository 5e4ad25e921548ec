#include <gtest/gtest.h>

#include "host/VersionOrder.h"

namespace appsync::host {
namespace {

TEST(VersionOrder, ComponentsCompareAsNumbers) {
  EXPECT_TRUE(compareVersions("1.10", "1.9") > 0);
  EXPECT_TRUE(compareVersions("2", "10") < 0);
}

TEST(VersionOrder, EqualTextsAreEqual) {
  EXPECT_TRUE(compareVersions("1.2.3", "1.2.3") == 0);
  EXPECT_TRUE(compareVersions("", "") == 0);
}

TEST(VersionOrder, AbsentComponentsCountAsZero) {
  EXPECT_TRUE(compareVersions("1", "1.0.0") == 0);
  EXPECT_TRUE(compareVersions("1.0.1", "1") > 0);
}

TEST(VersionOrder, LeadingZerosDoNotCount) {
  EXPECT_TRUE(compareVersions("1.01", "1.1") == 0);
}

TEST(VersionOrder, NumbersMayBeLongerThanAnyInteger) {
  EXPECT_TRUE(compareVersions("1.100000000000000000000000000001", "1.100000000000000000000000000000") > 0);
  EXPECT_TRUE(compareVersions("99999999999999999999999", "100000000000000000000000") < 0);
}

TEST(VersionOrder, TextAfterANumberComesSecond) {
  EXPECT_TRUE(compareVersions("1.0b2", "1.0b1") > 0);
  EXPECT_TRUE(compareVersions("1.2b", "1.10a") < 0);
}

TEST(VersionOrder, AnAbsentVersionIsTheOldest) {
  EXPECT_TRUE(compareVersions("", "0.1") < 0);
}

}  // namespace
}  // namespace appsync::host
