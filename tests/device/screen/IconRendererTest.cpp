#include <memory>
#include <string>

#include <gtest/gtest.h>

#include "device/apps/Bundles.h"
#include "device/screen/IconRenderer.h"
#include "device/screen/PNGEncoders.h"
#include "kit/fakes/FakeFileSystem.h"
#include "tests/device/screen/Pictures.h"

namespace appsync::test {
namespace {

using device::IconRenderer;
constexpr int kSize = IconRenderer::kIconSize;

class IconRendererTest : public testing::Test {
 protected:
  void putInfo(std::string_view info) { files.put("/A.app/Info.plist", info); }
  void putIcon(const Bytes& png) {
    putInfo("{BundleIconFile = \"Icon.png\";}");
    files.put("/A.app/Icon.png", png);
  }
  std::unique_ptr<platform::Image> render() {
    const auto bundle = device::Bundles(files).openBundle(platform::FileLocation::directory("/A.app").value());
    EXPECT_NE(bundle, nullptr);
    return renderer.createHomeScreenIconImage(*bundle);
  }
  cairo_surface_t* renderedSurface() {
    image = render();
    EXPECT_NE(image, nullptr);
    return image ? dynamic_cast<const device::IconImage&>(*image).surface() : nullptr;
  }

  CallJournal journal;
  FakeFileSystem files{journal};
  IconRenderer renderer{files};
  std::unique_ptr<platform::Image> image;
};

TEST_F(IconRendererTest, IconHasHomeScreenSizeAndRoundedCorners) {
  putIcon(makePNG(kSize, kSize, kRed));
  cairo_surface_t* icon = renderedSurface();
  ASSERT_NE(icon, nullptr);
  EXPECT_EQ(cairo_image_surface_get_width(icon), kSize);
  EXPECT_EQ(cairo_image_surface_get_height(icon), kSize);
  for (const int x : {0, kSize - 1}) {
    for (const int y : {0, kSize - 1})
      EXPECT_EQ(pixelAt(icon, x, y), kNothing) << x << "," << y;
    EXPECT_EQ(pixelAt(icon, x, kSize / 2), kRed);
    EXPECT_EQ(pixelAt(icon, kSize / 2, x), kRed);
  }
  EXPECT_EQ(pixelAt(icon, kSize / 2, kSize / 2), kRed);
}

class IconRendererSizes : public IconRendererTest, public testing::WithParamInterface<int> {};

TEST_P(IconRendererSizes, ScalesImageToFill) {
  putIcon(pngOf(makePicture(GetParam(), GetParam(), kRed, kBlue).get()));
  cairo_surface_t* icon = renderedSurface();
  ASSERT_NE(icon, nullptr);
  EXPECT_EQ(pixelAt(icon, 20, kSize / 2), kRed);
  EXPECT_EQ(pixelAt(icon, kSize - 21, kSize / 2), kBlue);
  EXPECT_EQ(pixelAt(icon, 0, kSize / 2), kRed);
  EXPECT_EQ(pixelAt(icon, kSize - 1, kSize / 2), kBlue);
}

INSTANTIATE_TEST_SUITE_P(IconRenderer, IconRendererSizes, testing::Values(8, 60, 120, 180, 512, 1024, 2048));

TEST_F(IconRendererTest, CropsLongerSide) {
  const auto wide = makePicture(400, 100, kRed, kRed);
  const device::Context context(cairo_create(wide.get()));
  cairo_set_source_rgb(context.get(), 0, 0, 1);
  cairo_rectangle(context.get(), 150, 0, 100, 100);
  cairo_fill(context.get());
  cairo_surface_flush(wide.get());
  putIcon(pngOf(wide.get()));
  cairo_surface_t* icon = renderedSurface();
  ASSERT_NE(icon, nullptr);
  EXPECT_EQ(pixelAt(icon, 3, kSize / 2), kBlue);
  EXPECT_EQ(pixelAt(icon, kSize - 4, kSize / 2), kBlue);
}

TEST_F(IconRendererTest, ReturnsNullWithoutUsableIcon) {
  const Bytes png = makePNG(8, 8, kRed);
  files.put("/A.app/Icon.png", png);
  files.put("/Icon.png", png);
  files.put("/A.app/broken.png", "\x89PNG\r\n\x1a\n");
  files.put("/A.app/empty.png", "");
  files.putFolder("/A.app/folder.png");
  for (const char* info :
       {"{BundleIdentifier = com.a;}", "garbage", "{BundleIconFile = \"\";}", "{BundleIconFile = (\"Icon.png\");}",
        "{BundleIconFile = \"missing.png\";}", "{BundleIconFile = \"../Icon.png\";}",
        "{BundleIconFile = \"a/../../Icon.png\";}", "{BundleIconFile = \"..\";}", "{BundleIconFile = \"broken.png\";}",
        "{BundleIconFile = \"empty.png\";}", "{BundleIconFile = \"folder.png\";}"}) {
    putInfo(info);
    EXPECT_EQ(render(), nullptr) << info;
  }
}

TEST_F(IconRendererTest, ReadsIconFromSubdirectory) {
  putInfo("{BundleIconFile = \"Resources/Icon.png\";}");
  files.put("/A.app/Resources/Icon.png", makePNG(8, 8, kRed));
  EXPECT_NE(render(), nullptr);
}

TEST_F(IconRendererTest, DoesNotReadHugeFile) {
  Bytes png = makePNG(8, 8, kRed);
  png.resize(IconRenderer::kMaximumFileSize + 1);
  putIcon(png);
  EXPECT_EQ(render(), nullptr);
  EXPECT_FALSE(journal.contains("fileSystem.readFile /A.app/Icon.png"));
}

class OtherImage final : public platform::Image {};

class PNGEncodersTest : public IconRendererTest {
 protected:
  device::PNGEncoders encoders;
  Bytes destination;
};

TEST_F(PNGEncodersTest, EncodedIconDecodesToSameImage) {
  putIcon(pngOf(makePicture(64, 64, kGreen, kBlue).get()));
  cairo_surface_t* icon = renderedSurface();
  const auto encoder = encoders.createEncoder(destination, 1);
  ASSERT_NE(encoder, nullptr);
  encoder->addImage(*image);
  EXPECT_TRUE(destination.empty());
  EXPECT_TRUE(encoder->finalize());
  const auto decoded = device::decodePNG(destination);
  ASSERT_NE(decoded, nullptr);
  for (int y = 0; y < kSize; ++y) {
    for (int x = 0; x < kSize; ++x) {
      // Half-transparent pixels are rounded, because PNG files do not premultiply colours.
      const Pixel expected = pixelAt(icon, x, y);
      const Pixel found = pixelAt(decoded.get(), x, y);
      for (unsigned shift = 0; shift < 32; shift += 8) {
        ASSERT_NEAR(static_cast<int>(found >> shift & 0xFFU), static_cast<int>(expected >> shift & 0xFFU), 1)
            << x << "," << y;
      }
    }
  }
}

TEST_F(PNGEncodersTest, ReplacesContentOfDestination) {
  putIcon(makePNG(8, 8, kRed));
  image = render();
  destination.resize(100);
  const auto encoder = encoders.createEncoder(destination, 1);
  encoder->addImage(*image);
  EXPECT_TRUE(encoder->finalize());
  EXPECT_NE(device::decodePNG(destination), nullptr);
}

TEST_F(PNGEncodersTest, AcceptsOneImageOnly) {
  EXPECT_EQ(encoders.createEncoder(destination, 0), nullptr);
  EXPECT_EQ(encoders.createEncoder(destination, 2), nullptr);
}

TEST_F(PNGEncodersTest, RejectsWrongNumberOfImagesAndForeignImages) {
  putIcon(makePNG(8, 8, kRed));
  image = render();
  EXPECT_FALSE(encoders.createEncoder(destination, 1)->finalize());

  const auto twice = encoders.createEncoder(destination, 1);
  twice->addImage(*image);
  twice->addImage(*image);
  EXPECT_FALSE(twice->finalize());

  const auto foreign = encoders.createEncoder(destination, 1);
  foreign->addImage(OtherImage());
  EXPECT_FALSE(foreign->finalize());
  EXPECT_TRUE(destination.empty());
}

}  // namespace
}  // namespace appsync::test
