// Property lists that other components wrote.
#include <optional>
#include <string>

#include <gtest/gtest.h>

#include "common/PropertyListFile.h"
#include "kit/fakes/FakePlatform.h"
#include "kit/fakes/SyncFileBuilder.h"

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

TEST_F(PropertyListFile, ARootOfAnotherTypeIsAnErrorOfItsOwn) {
  EXPECT_EQ(dictionaryOf(dictionary).value(), *dictionary.dictionary());
  EXPECT_EQ(dictionaryOf(plist::Value(7)).error(), (Error{"PropertyList", 2, "The root is not a dictionary", nullptr}));
  const Error error{"POSIX", 5, "no", nullptr};
  EXPECT_EQ(dictionaryOf(error).error(), error);
}

TEST_F(PropertyListFile, IsWrittenAsXML) {
  EXPECT_TRUE(writePropertyList(platform.files, "/tmp/a.plist", dictionary));
  EXPECT_EQ(platform.files.contents("/tmp/a.plist"), xmlForm(dictionary));
}

TEST_F(PropertyListFile, WhatCannotBeWrittenLeavesTheFileAlone) {
  EXPECT_FALSE(writePropertyList(platform.files, "/tmp/a.plist", plist::Dictionary{{"key", nullptr}}));
  EXPECT_FALSE(platform.files.has("/tmp/a.plist"));
}

}  // namespace
}  // namespace appsync::test
