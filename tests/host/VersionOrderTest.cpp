#include <gtest/gtest.h>

#include "host/VersionOrder.h"

namespace appsync::host {
namespace {

TEST(VersionOrder, ComparesComponentsAsNumbers) {
  EXPECT_TRUE(compareVersions("1.10", "1.9") > 0);
  EXPECT_TRUE(compareVersions("2", "10") < 0);
}

TEST(VersionOrder, EqualTextsAreEquivalent) {
  EXPECT_TRUE(compareVersions("1.2.3", "1.2.3") == 0);
  EXPECT_TRUE(compareVersions("", "") == 0);
}

TEST(VersionOrder, MissingComponentsCountAsZero) {
  EXPECT_TRUE(compareVersions("1", "1.0.0") == 0);
  EXPECT_TRUE(compareVersions("1.0.1", "1") > 0);
}

TEST(VersionOrder, IgnoresLeadingZeros) {
  EXPECT_TRUE(compareVersions("1.01", "1.1") == 0);
}

TEST(VersionOrder, ComparesNumbersBeyondIntegerRange) {
  EXPECT_TRUE(compareVersions("1.100000000000000000000000000001", "1.100000000000000000000000000000") > 0);
  EXPECT_TRUE(compareVersions("99999999999999999999999", "100000000000000000000000") < 0);
}

TEST(VersionOrder, ComparesTextAfterTheNumber) {
  EXPECT_TRUE(compareVersions("1.0b2", "1.0b1") > 0);
  EXPECT_TRUE(compareVersions("1.2b", "1.10a") < 0);
}

TEST(VersionOrder, OrdersEmptyVersionFirst) {
  EXPECT_TRUE(compareVersions("", "0.1") < 0);
}

}  // namespace
}  // namespace appsync::host
