#include <string>

#include <gtest/gtest.h>

#include "device/apps/Bundles.h"
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

TEST_F(BundlesTest, IgnoresFolderAndHugeFileAsInfo) {
  files.putFolder("/Folder.app/Info.plist");
  files.put("/Huge.app/Info.plist", "{BundleIdentifier = com.a;}" + std::string(kMaximumMetadataBytes, ' '));
  for (const char* path : {"/Folder.app", "/Huge.app"}) {
    const auto bundle = open(path);
    ASSERT_NE(bundle, nullptr) << path;
    EXPECT_EQ(bundle->infoDictionaryValue(platform::BundleIdentifierKey), nullptr) << path;
  }
}

TEST_F(BundlesTest, MainBundleIsDaemonByDefault) {
  EXPECT_EQ(bundles.mainBundleIdentifier(), "com.corvel.zeph");
  EXPECT_EQ(Bundles(files, "com.other").mainBundleIdentifier(), "com.other");
  EXPECT_EQ(Bundles(files, std::nullopt).mainBundleIdentifier(), std::nullopt);
}

}  // namespace
}  // namespace appsync::test
