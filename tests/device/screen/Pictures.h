// Creates and inspects images.
#pragma once

#include <cstdint>
#include <string_view>

#include <cairo/cairo.h>
#include <gtest/gtest.h>

#include "base/Bytes.h"
#include "device/screen/IconImage.h"

namespace appsync::test {

/// Blue in the lowest byte, then green, red and opacity.
using Pixel = std::uint32_t;
inline constexpr Pixel kRed = 0xFFFF0000;
inline constexpr Pixel kGreen = 0xFF00FF00;
inline constexpr Pixel kBlue = 0xFF0000FF;
inline constexpr Pixel kNothing = 0;

inline Pixel pixelAt(cairo_surface_t* picture, int x, int y) {
  const unsigned char* row = cairo_image_surface_get_data(picture) + y * cairo_image_surface_get_stride(picture);
  const unsigned char* bytes = row + 4 * x;
  return static_cast<Pixel>(bytes[0]) | static_cast<Pixel>(bytes[1]) << 8U | static_cast<Pixel>(bytes[2]) << 16U |
         static_cast<Pixel>(bytes[3]) << 24U;
}

/// Returns an opaque image with a left half of one colour and a right half of another.
inline device::Surface makePicture(int width, int height, Pixel left, Pixel right) {
  device::Surface picture(cairo_image_surface_create(CAIRO_FORMAT_ARGB32, width, height));
  const device::Context context(cairo_create(picture.get()));
  const auto paint = [&](int x, Pixel color) {
    const auto channel = [&](unsigned shift) { return static_cast<double>(color >> shift & 0xFFU) / 255; };
    cairo_rectangle(context.get(), x, 0, width, height);
    cairo_set_source_rgb(context.get(), channel(16), channel(8), channel(0));
    cairo_fill(context.get());
  };
  paint(0, left);
  paint(width / 2, right);
  cairo_surface_flush(picture.get());
  return picture;
}

inline Bytes pngOf(cairo_surface_t* picture) {
  Bytes png;
  EXPECT_TRUE(device::encodePNG(picture, png));
  return png;
}

/// Returns an opaque image of one colour.
inline Bytes makePNG(int width, int height, Pixel color) {
  return pngOf(makePicture(width, height, color, color).get());
}

}  // namespace appsync::test
