#include "device/screen/ScreenPicture.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <memory>
#include <optional>
#include <string_view>
#include <utility>

#include "device/screen/IconImage.h"
#include "device/screen/ScreenIcon.h"
#include "device/storage/HostFile.h"
#include "platform/Keys.h"
#include "plist/Access.h"

namespace appsync::device {

namespace {

// The layout of a page in pixels.
constexpr double kPageWidth = 750;
constexpr double kPageHeight = 1334;
constexpr double kPageCorner = 64;
constexpr int kColumns = 4;
constexpr int kRows = 6;
constexpr std::size_t kIconsPerPage = std::size_t{kColumns} * kRows;
constexpr double kColumnPitch = 174;
constexpr double kRowPitch = 192;
constexpr double kFirstColumn = (kPageWidth - (kColumns - 1) * kColumnPitch - IconRenderer::kIconSize) / 2;
constexpr double kFirstRow = 92;
constexpr double kNameWidth = kColumnPitch - 14;
constexpr double kGap = 60;
constexpr std::size_t kPagesInOneRow = 5;
constexpr double kMaximumPicturePixels = 16e6;

/// The positions of the pages in the picture.
struct Sheet {
  explicit Sheet(std::size_t icons) : pages(std::max<std::size_t>(1, (icons + kIconsPerPage - 1) / kIconsPerPage)) {
    const double squareColumns = std::ceil(std::sqrt(static_cast<double>(pages) * kPageHeight / kPageWidth));
    columns = pages <= kPagesInOneRow ? pages : static_cast<std::size_t>(squareColumns);
    const std::size_t rows = (pages + columns - 1) / columns;
    width = kGap + static_cast<double>(columns) * (kPageWidth + kGap);
    height = kGap + static_cast<double>(rows) * (kPageHeight + kGap);
    scale = std::min(1.0, std::sqrt(kMaximumPicturePixels / (width * height)));
  }

  void moveToPage(cairo_t* context, std::size_t page) const {
    const auto column = static_cast<double>(page % columns);
    const auto row = static_cast<double>(page / columns);
    cairo_translate(context, kGap + column * (kPageWidth + kGap), kGap + row * (kPageHeight + kGap));
  }

  std::size_t pages;
  std::size_t columns;
  double width;
  double height;
  double scale;
};

void addGlow(cairo_t* context, double x, double y, double radius, double red, double green, double blue) {
  cairo_pattern_t* glow = cairo_pattern_create_radial(x, y, 0, x, y, radius);
  cairo_pattern_add_color_stop_rgba(glow, 0, red, green, blue, 0.85);
  cairo_pattern_add_color_stop_rgba(glow, 1, red, green, blue, 0);
  cairo_set_source(context, glow);
  cairo_pattern_destroy(glow);
  cairo_paint(context);
}

void drawWallpaper(cairo_t* context) {
  cairo_pattern_t* sky = cairo_pattern_create_linear(0, 0, kPageWidth * 0.4, kPageHeight);
  cairo_pattern_add_color_stop_rgb(sky, 0, 0.07, 0.11, 0.32);
  cairo_pattern_add_color_stop_rgb(sky, 0.55, 0.24, 0.22, 0.52);
  cairo_pattern_add_color_stop_rgb(sky, 1, 0.62, 0.28, 0.42);
  cairo_set_source(context, sky);
  cairo_pattern_destroy(sky);
  cairo_paint(context);
  addGlow(context, 640, 180, 620, 0.16, 0.42, 0.72);
  addGlow(context, 80, 1290, 700, 0.93, 0.49, 0.36);
}

/// Draws a dot for each page, the current one bright. Dots that do not fit the width are omitted.
void drawPageDots(cairo_t* context, std::size_t current, std::size_t pages) {
  constexpr double kPitch = 28;
  const double width = static_cast<double>(pages - 1) * kPitch;
  if (pages < 2 || width > kPageWidth - 2 * kFirstColumn) return;
  for (std::size_t page = 0; page < pages; ++page) {
    const double x = (kPageWidth - width) / 2 + static_cast<double>(page) * kPitch;
    cairo_new_sub_path(context);
    cairo_arc(context, x, kPageHeight - 46, 7, 0, 7);
    cairo_set_source_rgba(context, 1, 1, 1, page == current ? 0.95 : 0.35);
    cairo_fill(context);
  }
}

void drawEmptyPage(cairo_t* context, const Sheet& sheet, std::size_t page) {
  cairo_save(context);
  sheet.moveToPage(context, page);
  addRoundedRectangle(context, kPageWidth, kPageHeight, kPageCorner);
  cairo_clip(context);
  drawWallpaper(context);
  drawPageDots(context, page, sheet.pages);
  cairo_restore(context);
}

IconState stateOf(const platform::AppRecord& app, const platform::InstallProgress* progress) {
  using platform::TSInstallState;
  if (!app.isPlaceholder()) return IconState::installed;
  if (progress == nullptr) return IconState::waiting;
  switch (progress->installState()) {
    case TSInstallState::Active:
      return IconState::running;
    case TSInstallState::Paused:
      return IconState::paused;
    default:
      return IconState::waiting;
  }
}

double fractionOf(const platform::InstallProgress* progress) {
  if (progress == nullptr || progress->totalUnitCount() <= 0) return 0;
  const double fraction =
      static_cast<double>(progress->completedUnitCount()) / static_cast<double>(progress->totalUnitCount());
  return std::clamp(fraction, 0.0, 1.0);
}

std::string nameOf(const platform::AppRecord& app, const platform::Bundle* bundle) {
  const plist::Value* name = bundle == nullptr ? nullptr : bundle->infoDictionaryValue(platform::kBundleDisplayNameKey);
  const auto text = stringIn(name);
  return text && !text->empty() ? std::string(*text) : app.applicationIdentifier();
}

void drawApp(cairo_t* context, const ScreenServices& services, const platform::AppRecord& app) {
  const auto location = platform::FileLocation::directory(app.bundlePath().value_or(""));
  const auto bundle = location ? services.bundles.openBundle(*location) : nullptr;
  const auto image = bundle ? services.iconRenderer.createHomeScreenIconImage(*bundle) : nullptr;
  const auto* picture = dynamic_cast<const IconImage*>(image.get());
  const auto progress = app.installProgress();
  drawScreenIcon(context,
                 {.bundleIdentifier = app.applicationIdentifier(),
                  .name = nameOf(app, bundle.get()),
                  .picture = picture == nullptr ? nullptr : picture->surface(),
                  .state = stateOf(app, progress.get()),
                  .fraction = fractionOf(progress.get())},
                 kNameWidth);
}

using Apps = std::vector<std::shared_ptr<const platform::AppRecord>>;

Result<Apps> appsOnScreen(const ScreenServices& services) {
  const auto order = services.homeScreen.iconOrder();
  if (!order) return order.error();
  Apps apps;
  for (const std::string& identifier : *order) {
    if (auto app = services.registry.recordForIdentifier(identifier, platform::PlaceholderLookup::on)) {
      apps.push_back(std::move(app));
    }
  }
  return apps;
}

void drawSheet(cairo_t* context, const ScreenServices& services, const Sheet& sheet, const Apps& apps) {
  cairo_set_source_rgb(context, 0.09, 0.09, 0.11);
  cairo_paint(context);
  cairo_scale(context, sheet.scale, sheet.scale);
  for (std::size_t page = 0; page < sheet.pages; ++page)
    drawEmptyPage(context, sheet, page);
  for (std::size_t index = 0; index < apps.size(); ++index) {
    const std::size_t place = index % kIconsPerPage;
    cairo_save(context);
    sheet.moveToPage(context, index / kIconsPerPage);
    cairo_translate(context, kFirstColumn + static_cast<double>(place % kColumns) * kColumnPitch,
                    kFirstRow + static_cast<double>(place / kColumns) * kRowPitch);
    drawApp(context, services, *apps[index]);
    cairo_restore(context);
  }
}

}  // namespace

Status drawScreen(const ScreenServices& services, const std::string& hostPath) {
  const Result<Apps> apps = appsOnScreen(services);
  if (!apps) return apps.error().in("cannot draw the screen");
  const Sheet sheet(apps->size());
  const Surface picture(cairo_image_surface_create(CAIRO_FORMAT_RGB24,
                                                   static_cast<int>(std::ceil(sheet.width * sheet.scale)),
                                                   static_cast<int>(std::ceil(sheet.height * sheet.scale))));
  const Context context(cairo_create(picture.get()));
  drawSheet(context.get(), services, sheet, *apps);
  Bytes png;
  const cairo_status_t drawn = cairo_status(context.get());
  if (drawn != CAIRO_STATUS_SUCCESS || !encodePNG(picture.get(), png)) {
    return Error{std::string(kDrawingDomain), static_cast<long>(drawn),
                 std::string("cannot draw the screen: ") + cairo_status_to_string(drawn), nullptr};
  }
  return writeHostFile(hostPath, png);
}

}  // namespace appsync::device
