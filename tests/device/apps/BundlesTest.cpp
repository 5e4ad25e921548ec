#include <string>

#include <gtest/gtest.h>

#include "device/apps/Bundles.h"
#include "device/packages/BundleInfo.h"
#include "kit/fakes/FakeFileSystem.h"
#include "platform/Keys.h"
#include "platform/SyncFiles.h"

namespace appsync::test {
namespace {

using device::Bundles;
using platform::FileLocation;

class BundlesTest : public testing::Test {
 protected:
  std::unique_ptr<platform::Bundle> open(std::string_view path) {
    return bundles.openBundle(FileLocation::directory(path).value());
  }

  CallJournal journal;
  FakeFileSystem files{journal};
  Bundles bundles{files};
};

TEST_F(BundlesTest, OpensAFolderWithAnInfoDictionary) {
  files.put("/apps/A.app/Info.plist", "{BundleIdentifier = com.a; BundleDisplayName = \"An App\";}");
  const auto bundle = open("/apps/A.app");
  ASSERT_NE(bundle, nullptr);
  EXPECT_EQ(bundle->location(), FileLocation::directory("/apps/A.app"));
  const plist::Value* name = bundle->infoDictionaryValue(platform::kBundleDisplayNameKey);
  ASSERT_NE(name, nullptr);
  EXPECT_EQ(*name, plist::Value("An App"));
  EXPECT_EQ(bundle->infoDictionaryValue("Other"), nullptr);
}

TEST_F(BundlesTest, ABundleIsWhatItWasWhenItWasOpened) {
  files.put("/A.app/Info.plist", "{BundleIdentifier = com.a;}");
  const auto bundle = open("/A.app");
  files.erase("/A.app");
  EXPECT_NE(bundle->infoDictionaryValue(platform::BundleIdentifierKey), nullptr);
}

TEST_F(BundlesTest, WhatIsNotAFolderIsNoBundle) {
  files.put("/file", "{BundleIdentifier = com.a;}");
  EXPECT_EQ(open("/missing"), nullptr);
  EXPECT_EQ(open("/file"), nullptr);
}

TEST_F(BundlesTest, AFolderWithoutUsableInfoOpensWithoutInfo) {
  files.putFolder("/Empty.app");
  files.put("/Garbage.app/Info.plist", "\x01\x02");
  files.put("/Array.app/Info.plist", "(BundleIdentifier)");
  files.putFolder("/Folder.app/Info.plist");
  files.put("/Huge.app/Info.plist", "{BundleIdentifier = com.a;}" + std::string(kMaximumMetadataBytes, ' '));
  for (const char* path : {"/Empty.app", "/Garbage.app", "/Array.app", "/Folder.app", "/Huge.app"}) {
    const auto bundle = open(path);
    ASSERT_NE(bundle, nullptr) << path;
    EXPECT_EQ(bundle->infoDictionaryValue(platform::BundleIdentifierKey), nullptr) << path;
  }
}

TEST_F(BundlesTest, TheProcessIsTheDaemonUnlessToldOtherwise) {
  EXPECT_EQ(bundles.mainBundleIdentifier(), "com.corvel.zeph");
  EXPECT_EQ(Bundles(files, "com.other").mainBundleIdentifier(), "com.other");
  EXPECT_EQ(Bundles(files, std::nullopt).mainBundleIdentifier(), std::nullopt);
}

}  // namespace
}  // namespace appsync::test
