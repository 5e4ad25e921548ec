// Property lists that other components wrote.
#include <optional>
#include <string>

#include <gtest/gtest.h>

#include "core/PropertyListFile.h"
#include "tests/support/FakePlatform.h"
#include "tests/support/TodoList.h"

namespace appsync::test {
namespace {

class PropertyListFile : public testing::Test {
 protected:
  plist::Value read(const std::optional<std::string>& path = "/Info.plist") {
    return readDictionary(platform.files, path);
  }

  FakePlatform platform;
  const plist::Value dictionary = plist::Dictionary{{"key", "value"}};
};

TEST_F(PropertyListFile, ADictionaryIsReadInEachForm) {
  platform.files.put("/Info.plist", binaryForm(dictionary));
  EXPECT_EQ(read(), dictionary);
  platform.files.put("/Info.plist", xmlForm(dictionary));
  EXPECT_EQ(read(), dictionary);
  platform.files.put("/Info.plist", "{ key = value; }");
  EXPECT_EQ(read(), dictionary);
}

TEST_F(PropertyListFile, WithoutAPathOrAFileThereIsNone) {
  EXPECT_TRUE(read(std::nullopt).isNull());
  EXPECT_EQ(platform.journal.count("fileSystem."), 0U) << "there is nothing to ask for";
  EXPECT_TRUE(read().isNull());
}

TEST_F(PropertyListFile, WhatIsNoDictionaryIsNone) {
  platform.files.put("/Info.plist", binaryForm(plist::Array{dictionary}));
  EXPECT_TRUE(read().isNull());
  platform.files.put("/Info.plist", "bplist00");
  EXPECT_TRUE(read().isNull());
  platform.files.put("/Info.plist", "");
  EXPECT_TRUE(read().isNull());
}

}  // namespace
}  // namespace appsync::test
