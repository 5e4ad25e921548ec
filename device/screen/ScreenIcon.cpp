#include "device/screen/ScreenIcon.h"

#include <algorithm>
#include <cmath>
#include <numbers>
#include <string_view>

#include "device/screen/IconRenderer.h"

namespace appsync::device {

namespace {

constexpr double kSize = IconRenderer::kIconSize;
constexpr double kCenter = kSize / 2;
constexpr double kRingRadius = 32;
constexpr double kRingWidth = 8;
constexpr double kNameSize = 21;
constexpr double kNameBaseline = kSize + 30;
/// More than any width shows.
constexpr std::size_t kLongestName = 256;

bool continuesCharacter(char byte) {
  return (static_cast<unsigned char>(byte) & 0xC0U) == 0x80;
}

void dropLastCharacter(std::string& text) {
  while (!text.empty() && continuesCharacter(text.back()))
    text.pop_back();
  if (!text.empty()) text.pop_back();
}

/// Returns the start of a name as one line.
std::string shownName(std::string_view name) {
  std::string shown(name.substr(0, kLongestName));
  if (shown.size() < name.size()) {
    if (continuesCharacter(name[kLongestName])) dropLastCharacter(shown);
  }
  std::ranges::replace_if(
      shown, [](char byte) { return static_cast<unsigned char>(byte) < 0x20; }, ' ');
  return shown;
}

double widthOf(cairo_t* context, const std::string& text) {
  cairo_text_extents_t extents;
  cairo_text_extents(context, text.c_str(), &extents);
  return extents.x_advance;
}

/// Returns `name`, its end replaced by an ellipsis if it is wider than `width`.
std::string fittingName(cairo_t* context, std::string_view name, double width) {
  std::string shown = shownName(name);
  if (shown.size() == name.size() && widthOf(context, shown) <= width) return shown;
  const std::string ellipsis = "\u2026";
  while (!shown.empty() && widthOf(context, shown + ellipsis) > width)
    dropLastCharacter(shown);
  while (shown.ends_with(' '))
    shown.pop_back();
  return shown + ellipsis;
}

void showCentered(cairo_t* context, const std::string& text, double x, double baseline) {
  cairo_move_to(context, x - widthOf(context, text) / 2, baseline);
  cairo_show_text(context, text.c_str());
}

void drawName(cairo_t* context, std::string_view name, double width) {
  cairo_select_font_face(context, "sans-serif", CAIRO_FONT_SLANT_NORMAL, CAIRO_FONT_WEIGHT_NORMAL);
  cairo_set_font_size(context, kNameSize);
  const std::string text = fittingName(context, name, width);
  cairo_set_source_rgba(context, 0, 0, 0, 0.45);
  showCentered(context, text, kCenter + 1, kNameBaseline + 1.5);
  cairo_set_source_rgb(context, 1, 1, 1);
  showCentered(context, text, kCenter, kNameBaseline);
}

/// Returns one of 360 hues, which depends on the identifier only.
double hueOf(std::string_view identifier) {
  std::uint32_t hash = 2166136261U;
  for (const char letter : identifier)
    hash = (hash ^ static_cast<unsigned char>(letter)) * 16777619U;
  return static_cast<double>(hash % 360U);
}

struct Color {
  double red, green, blue;
};

Color colorOf(double hue, double saturation, double value) {
  const auto channel = [&](double offset) {
    const double place = std::fmod(offset + hue / 60, 6);
    return value - value * saturation * std::clamp(std::min(place, 4 - place), 0.0, 1.0);
  };
  return {channel(5), channel(3), channel(1)};
}

void fillWithColorOf(cairo_t* context, std::string_view identifier) {
  const double hue = hueOf(identifier);
  const Color top = colorOf(hue, 0.55, 0.95);
  const Color bottom = colorOf(hue + 25, 0.80, 0.68);
  cairo_pattern_t* gradient = cairo_pattern_create_linear(0, 0, 0, kSize);
  cairo_pattern_add_color_stop_rgb(gradient, 0, top.red, top.green, top.blue);
  cairo_pattern_add_color_stop_rgb(gradient, 1, bottom.red, bottom.green, bottom.blue);
  cairo_set_source(context, gradient);
  cairo_pattern_destroy(gradient);
  addRoundedRectangle(context, kSize, kSize, IconRenderer::kCornerRadius);
  cairo_fill(context);
}

/// Returns the first character, in upper case if it is an ASCII letter.
std::string initialOf(std::string_view name) {
  std::size_t length = name.empty() ? 0 : 1;
  while (length < name.size() && continuesCharacter(name[length]))
    ++length;
  std::string initial = shownName(name.substr(0, length));
  if (initial.size() == 1 && initial[0] >= 'a' && initial[0] <= 'z') initial[0] = static_cast<char>(initial[0] - 32);
  return initial;
}

void drawInitial(cairo_t* context, std::string_view name) {
  const std::string initial = initialOf(name);
  cairo_select_font_face(context, "sans-serif", CAIRO_FONT_SLANT_NORMAL, CAIRO_FONT_WEIGHT_BOLD);
  cairo_set_font_size(context, 62);
  cairo_set_source_rgba(context, 1, 1, 1, 0.95);
  showCentered(context, initial, kCenter, kCenter + 22);
}

void drawPicture(cairo_t* context, const ScreenIcon& icon) {
  if (icon.picture == nullptr) {
    fillWithColorOf(context, icon.bundleIdentifier);
    drawInitial(context, icon.name);
    return;
  }
  cairo_set_source_surface(context, icon.picture, 0, 0);
  cairo_paint(context);
}

void strokeArc(cairo_t* context, double fraction, double opacity) {
  constexpr double kTop = -std::numbers::pi / 2;
  cairo_new_path(context);
  cairo_arc(context, kCenter, kCenter, kRingRadius, kTop, kTop + 2 * std::numbers::pi * fraction);
  cairo_set_source_rgba(context, 1, 1, 1, opacity);
  cairo_set_line_width(context, kRingWidth);
  cairo_set_line_cap(context, CAIRO_LINE_CAP_ROUND);
  cairo_stroke(context);
}

void drawPauseSign(cairo_t* context) {
  cairo_set_source_rgba(context, 1, 1, 1, 0.95);
  cairo_rectangle(context, kCenter - 11, kCenter - 13, 7, 26);
  cairo_rectangle(context, kCenter + 4, kCenter - 13, 7, 26);
  cairo_fill(context);
}

void drawState(cairo_t* context, const ScreenIcon& icon) {
  if (icon.state == IconState::installed) return;
  addRoundedRectangle(context, kSize, kSize, IconRenderer::kCornerRadius);
  cairo_set_source_rgba(context, 0, 0, 0, 0.55);
  cairo_fill(context);
  cairo_arc(context, kCenter, kCenter, kRingRadius, 0, 2 * std::numbers::pi);
  cairo_set_source_rgba(context, 0, 0, 0, 0.6);
  cairo_fill(context);
  strokeArc(context, 1, 0.3);
  if (icon.state != IconState::waiting && icon.fraction > 0) strokeArc(context, std::min(icon.fraction, 1.0), 0.95);
  if (icon.state == IconState::paused) drawPauseSign(context);
}

}  // namespace

void drawScreenIcon(cairo_t* context, const ScreenIcon& icon, double width) {
  drawPicture(context, icon);
  drawState(context, icon);
  drawName(context, icon.name, width);
}

}  // namespace appsync::device
