#include <regex>

#include <gtest/gtest.h>

#include "device/storage/RandomNames.h"

namespace appsync::test {
namespace {

TEST(UUID, IsVersionFourAndUnique) {
  const std::string first = device::newUUID();
  const std::string second = device::newUUID();
  const std::regex form("[0-9A-F]{8}-[0-9A-F]{4}-4[0-9A-F]{3}-[89AB][0-9A-F]{3}-[0-9A-F]{12}");
  EXPECT_TRUE(std::regex_match(first, form)) << first;
  EXPECT_TRUE(std::regex_match(second, form)) << second;
  EXPECT_NE(first, second);
}

}  // namespace
}  // namespace appsync::test
