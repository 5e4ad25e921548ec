#include <gtest/gtest.h>

#include "kit/fakes/FakePlatform.h"
#include "kit/fakes/SyncFileBuilder.h"

namespace appsync::test {
namespace {

TEST(FakeBundles, OpeningADirectoryCanFail) {
  FakePlatform platform;
  putAppFolder(platform.files, "/a.app", "com.a", "A");
  putAppFolder(platform.files, "/b.app", "com.b", "B");
  platform.bundleFolders.failOpening("/a.app");
  EXPECT_EQ(platform.bundles().openBundle({"/a.app", true}), nullptr);
  EXPECT_NE(platform.bundles().openBundle({"/b.app", true}), nullptr);
}

}  // namespace
}  // namespace appsync::test
