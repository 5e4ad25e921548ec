#include <cstdlib>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "device/apps/Bundles.h"
#include "device/screen/ScreenPicture.h"
#include "kit/fakes/FakeAppRegistry.h"
#include "tests/device/screen/Pictures.h"
#include "tests/support/ServiceDatabase.h"

namespace appsync::test {
namespace {

using platform::TSInstallPhase;
using platform::TSInstallState;

// Sizes of a picture with one row of pages.
constexpr int kPagePitch = 810;
constexpr int kLeft = 60 + 54;
constexpr int kTop = 60 + 92;
constexpr int kColumn = 174;
constexpr int kRow = 192;

class ScreenPictureTest : public testing::Test {
 protected:
  void addApp(const FakeApp& app, std::string_view name, std::optional<Pixel> icon) {
    registry.add(app);
    const std::string& bundle = app.bundlePath.value();
    std::string info = "{BundleIconFile = \"Icon.png\"; BundleDisplayName = \"" + std::string(name) + "\";}";
    files.put(bundle + "/Info.plist", info);
    if (icon) files.put(bundle + "/Icon.png", makePNG(120, 120, *icon));
  }
  device::Surface draw() {
    const Status drawn = device::drawScreen({homeScreen, registry, bundles, renderer}, path);
    EXPECT_TRUE(drawn) << (drawn ? "" : drawn.error().text);
    device::Surface picture(cairo_image_surface_create_from_png(path.c_str()));
    EXPECT_EQ(cairo_surface_status(picture.get()), CAIRO_STATUS_SUCCESS);
    return picture;
  }
  /// Returns the pixel a quarter down the icon at a column, row and page.
  static Pixel iconPixel(const device::Surface& picture, int column, int row, int page = 0) {
    return pixelAt(picture.get(), kLeft + page * kPagePitch + column * kColumn + 60, kTop + row * kRow + 12) |
           0xFF000000;
  }
  static bool isDimmed(Pixel pixel, Pixel color) {
    for (unsigned shift = 0; shift < 24; shift += 8) {
      const int channel = static_cast<int>(color >> shift & 0xFFU);
      if (std::abs(static_cast<int>(pixel >> shift & 0xFFU) - channel * 45 / 100) > 2) return false;
    }
    return true;
  }

  CallJournal journal;
  FakeFileSystem files{journal};
  FakeUninstalledAppsList uninstalled{journal};
  FakeAppRegistry registry{journal, files, uninstalled};
  ServiceDatabase<device::Settings, device::HomeScreen> database;
  device::Settings settings{database};
  device::HomeScreen homeScreen{database, registry, settings};
  device::Bundles bundles{files};
  device::IconRenderer renderer{files};
  const TemporaryFolder folder;
  const std::string path = folder.path("screen.png");
};

TEST_F(ScreenPictureTest, EmptyScreenHasOnePage) {
  const auto picture = draw();
  EXPECT_EQ(cairo_image_surface_get_width(picture.get()), 870);
  EXPECT_EQ(cairo_image_surface_get_height(picture.get()), 1454);
}

TEST_F(ScreenPictureTest, DrawsIconsInOrder) {
  addApp(FakeApp::installed("com.a"), "A", kRed);
  addApp(FakeApp::installed("com.b"), "B", kGreen);
  addApp(FakeApp::installed("com.c"), "C", kBlue);
  homeScreen.setIconState(homeScreen.blockableServerPort(), bytesOf("(com.missing, com.c, com.a)"));
  const auto picture = draw();
  EXPECT_EQ(iconPixel(picture, 0, 0), kBlue);
  EXPECT_EQ(iconPixel(picture, 1, 0), kRed);
  EXPECT_EQ(iconPixel(picture, 2, 0), kGreen);
}

TEST_F(ScreenPictureTest, ContinuesOnNextPage) {
  for (int number = 10; number < 36; ++number) {
    addApp(FakeApp::installed("com." + std::to_string(number)), "App", number < 34 ? kRed : kGreen);
  }
  const auto picture = draw();
  EXPECT_EQ(cairo_image_surface_get_width(picture.get()), 870 + kPagePitch);
  EXPECT_EQ(iconPixel(picture, 3, 0), kRed);
  EXPECT_EQ(iconPixel(picture, 0, 1), kRed);
  EXPECT_EQ(iconPixel(picture, 3, 5), kRed);
  EXPECT_EQ(iconPixel(picture, 0, 0, 1), kGreen);
  EXPECT_EQ(iconPixel(picture, 1, 0, 1), kGreen);
}

TEST_F(ScreenPictureTest, DimsPlaceholders) {
  addApp(FakeApp::placeholder("com.a"), "A", kRed);
  addApp(FakeApp::updating("com.b").withProgress(TSInstallState::Active, TSInstallPhase::Loading), "B", kGreen);
  addApp(FakeApp::placeholder("com.c").withoutProgress(), "C", kBlue);
  const auto picture = draw();
  EXPECT_TRUE(isDimmed(iconPixel(picture, 0, 0), kRed));
  EXPECT_TRUE(isDimmed(iconPixel(picture, 1, 0), kGreen));
  EXPECT_TRUE(isDimmed(iconPixel(picture, 2, 0), kBlue));
}

TEST_F(ScreenPictureTest, RingShowsProgress) {
  const auto app = FakeApp::placeholder("com.a").withProgress(TSInstallState::Active, TSInstallPhase::Loading);
  addApp(app, "A", kRed);
  const auto ringAt = [&](int dx, int dy) { return pixelAt(draw().get(), kLeft + 60 + dx, kTop + 60 + dy) & 0xFFU; };
  app.progress->setTotalUnitCount(1000);
  app.progress->setCompletedUnitCount(500);
  EXPECT_GT(ringAt(32, 0), 200U) << "right: within the first half";
  EXPECT_LT(ringAt(-32, 0), 120U) << "left: in the second half";
  app.progress->setCompletedUnitCount(1000);
  EXPECT_GT(ringAt(-32, 0), 200U);
}

TEST_F(ScreenPictureTest, ClampsInvalidProgress) {
  const auto app = FakeApp::placeholder("com.a").withProgress(TSInstallState::Active, TSInstallPhase::Loading);
  addApp(app, "A", kRed);
  for (const auto& [completed, total] : {std::pair(5, 0), std::pair(-5, 10), std::pair(50, 10), std::pair(5, -10)}) {
    app.progress->setTotalUnitCount(total);
    app.progress->setCompletedUnitCount(completed);
    EXPECT_TRUE(isDimmed(iconPixel(draw(), 0, 0), kRed));
  }
}

TEST_F(ScreenPictureTest, AppWithoutIconHasStableColour) {
  addApp(FakeApp::installed("com.a"), "A", std::nullopt);
  registry.add(FakeApp::installed("com.b").withBundlePath(std::nullopt));
  const auto picture = draw();
  const auto again = draw();
  EXPECT_EQ(iconPixel(picture, 0, 0), iconPixel(again, 0, 0));
  EXPECT_NE(iconPixel(picture, 0, 0), iconPixel(picture, 1, 0));
  EXPECT_NE(iconPixel(picture, 0, 0), iconPixel(picture, 2, 0)) << "not the wallpaper";
}

TEST_F(ScreenPictureTest, DrawsEveryName) {
  std::vector<std::string> names{"", "\xF0\x9F\x8E\xAE game", "line\nbreak", "\xD7\xA9\xD7\x9C\xD7\x95\xD7\x9D",
                                 "e\xCC\x81"};
  names.emplace_back(100'000, 'W');
  names.emplace_back(200, ' ');
  // Characters across the length at which names are truncated.
  names.emplace_back(255, 'x');
  names.back().append("\xC3\xA9");
  names.emplace_back(254, 'x');
  names.back().append("\xE2\x82\xAC");
  for (int number = 10; const std::string& name : names) {
    addApp(FakeApp::installed("com." + std::to_string(number++)), name, std::nullopt);
  }
  draw();
}

TEST_F(ScreenPictureTest, ManyPagesAreMadeSmaller) {
  for (int number = 0; number < 1000; ++number)
    registry.add(FakeApp::installed("com." + std::to_string(number)));
  const auto picture = draw();
  const auto pixels =
      static_cast<double>(cairo_image_surface_get_width(picture.get())) * cairo_image_surface_get_height(picture.get());
  EXPECT_LT(pixels, 16.1e6);
  EXPECT_GT(pixels, 15e6);
}

TEST_F(ScreenPictureTest, AFailureLeavesTheFileAsItWas) {
  ASSERT_TRUE(draw());
  const auto before = draw();
  database.drop("icon_layout");
  const Status drawn = device::drawScreen({homeScreen, registry, bundles, renderer}, path);
  ASSERT_FALSE(drawn);
  EXPECT_EQ(drawn.error().domain, device::kSQLiteDomain);
  EXPECT_EQ(drawn.error().text, "cannot draw the screen: database: no such table: icon_layout");
  const device::Surface after(cairo_image_surface_create_from_png(path.c_str()));
  EXPECT_EQ(cairo_surface_status(after.get()), CAIRO_STATUS_SUCCESS);
}

TEST_F(ScreenPictureTest, AFileThatCannotBeWrittenIsAClearError) {
  const Status drawn = device::drawScreen({homeScreen, registry, bundles, renderer}, "/missing/screen.png");
  ASSERT_FALSE(drawn);
  EXPECT_EQ(drawn.error().domain, domains::kPOSIX);
}

}  // namespace
}  // namespace appsync::test
