#include "device/screen/IconRenderer.h"

#include <algorithm>
#include <numbers>
#include <string>

#include "device/packages/BundleInfo.h"
#include "platform/Keys.h"

namespace appsync::device {

namespace {

/// Fills the square at the origin with the centre of `picture`.
void paintIcon(cairo_t* context, cairo_surface_t* picture, double size, double cornerRadius) {
  const double width = cairo_image_surface_get_width(picture);
  const double height = cairo_image_surface_get_height(picture);
  const double scale = size / std::min(width, height);
  addRoundedRectangle(context, size, size, cornerRadius);
  cairo_translate(context, (size - width * scale) / 2, (size - height * scale) / 2);
  cairo_scale(context, scale, scale);
  cairo_set_source_surface(context, picture, 0, 0);
  cairo_pattern_set_filter(cairo_get_source(context), CAIRO_FILTER_GOOD);
  cairo_pattern_set_extend(cairo_get_source(context), CAIRO_EXTEND_PAD);
  cairo_fill(context);
}

}  // namespace

void addRoundedRectangle(cairo_t* context, double width, double height, double cornerRadius) {
  constexpr double kQuarter = std::numbers::pi / 2;
  const double right = width - cornerRadius;
  const double bottom = height - cornerRadius;
  cairo_new_sub_path(context);
  cairo_arc(context, right, cornerRadius, cornerRadius, -kQuarter, 0);
  cairo_arc(context, right, bottom, cornerRadius, 0, kQuarter);
  cairo_arc(context, cornerRadius, bottom, cornerRadius, kQuarter, 2 * kQuarter);
  cairo_arc(context, cornerRadius, cornerRadius, cornerRadius, 2 * kQuarter, 3 * kQuarter);
  cairo_close_path(context);
}

std::optional<std::string> iconPathIn(const platform::Bundle& bundle) {
  return namedFileIn(bundle.location().path, bundle.infoDictionaryValue(platform::kBundleIconFileKey));
}

std::unique_ptr<platform::Image> IconRenderer::createHomeScreenIconImage(const platform::Bundle& bundle) {
  const auto path = iconPathIn(bundle);
  if (!path) return nullptr;
  const auto attributes = fileSystem_.attributesOfItem(*path);
  if (!attributes || attributes->isDirectory || attributes->size > kMaximumFileSize) return nullptr;
  const auto file = fileSystem_.readFile(*path);
  if (!file) return nullptr;
  const Surface picture = decodePNG(*file);
  if (!picture) return nullptr;

  Surface icon(cairo_image_surface_create(CAIRO_FORMAT_ARGB32, kIconSize, kIconSize));
  const Context context(cairo_create(icon.get()));
  paintIcon(context.get(), picture.get(), kIconSize, kCornerRadius);
  cairo_surface_flush(icon.get());
  if (cairo_status(context.get()) != CAIRO_STATUS_SUCCESS) return nullptr;
  return std::make_unique<IconImage>(std::move(icon));
}

}  // namespace appsync::device
