// From an app bundle to a PNG file of its home-screen icon.
#include <string>

#include <gtest/gtest.h>

#include "core/AppsClient.h"
#include "kit/fakes/FakePlatform.h"
#include "kit/fakes/SyncFileBuilder.h"

namespace appsync::test {
namespace {

constexpr std::string_view kDestination = "/icons/com.a.png";

class IconFromBundle : public testing::Test {
 protected:
  void SetUp() override {
    platform.files.putFolder("/icons");
    putAppFolder(platform.files, "/apps/A.app", "com.a", "A");
  }

  bool make(const std::optional<std::string>& bundlePath = "/apps/A.app") {
    return AppsClient::_makeIconFromBundlePath(platform, bundlePath, kDestination);
  }

  /// Checks that nothing was made, and that this alone was said.
  void expectFailure(std::string_view message) {
    EXPECT_TRUE(sameLines({loggedError(message)}, platform.log.lines()));
    EXPECT_FALSE(platform.files.has(kDestination));
  }

  FakePlatform platform;
};

TEST_F(IconFromBundle, TheRenderedIconIsSavedWithoutAWord) {
  EXPECT_TRUE(make());
  EXPECT_EQ(platform.files.text(kDestination), FakePNGEncoders::pngOf("icon of com.a"));
  EXPECT_TRUE(platform.log.lines().empty());
}

TEST_F(IconFromBundle, WithoutABundlePathThereIsNone) {
  EXPECT_FALSE(make(std::nullopt));
  expectFailure("missing bundlePath");
}

TEST_F(IconFromBundle, APathThatNoFileCanHaveIsNoURL) {
  EXPECT_FALSE(make(std::string("/apps/\0A.app", 12)));
  expectFailure("couldn't create URL");
}

TEST_F(IconFromBundle, AFolderThatIsNoBundleIsSaid) {
  EXPECT_FALSE(make("/apps/missing.app"));
  expectFailure("couldn't create bundle from URL");
}

TEST_F(IconFromBundle, ABundleWithoutAUsableIconIsSaid) {
  platform.files.erase("/apps/A.app/Icon.png");
  EXPECT_FALSE(make());
  expectFailure("couldn't create SV icon from bundle");
}

TEST_F(IconFromBundle, AMissingEncoderIsSaid) {
  platform.encoders.fail(EncoderFailure::creation);
  EXPECT_FALSE(make());
  expectFailure("couldn't create image");
}

TEST_F(IconFromBundle, AnEncodingThatFailsIsSaid) {
  platform.encoders.fail(EncoderFailure::finalization);
  EXPECT_FALSE(make());
  expectFailure("Couldn't finalize image");
}

TEST_F(IconFromBundle, APictureThatCannotBeSavedIsSaid) {
  platform.files.failures.failNext(FileOperation::writeFileAtomically, kDestination,
                                   Error{"POSIX", 28, "No space left on device", nullptr});
  EXPECT_FALSE(make());
  expectFailure("Couldn't save image file to /icons/com.a.png");
}

}  // namespace
}  // namespace appsync::test
