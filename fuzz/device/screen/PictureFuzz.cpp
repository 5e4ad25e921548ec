// Reads the input as a PNG file. A picture that comes of it is no larger than promised, and becomes a PNG file again.
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <span>

#include "device/screen/IconImage.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  using namespace appsync;
  const device::Surface picture = device::decodePNG(std::as_bytes(std::span(data, size)));
  if (!picture) return 0;
  const auto width = static_cast<std::uint64_t>(cairo_image_surface_get_width(picture.get()));
  const auto height = static_cast<std::uint64_t>(cairo_image_surface_get_height(picture.get()));
  Bytes written;
  const bool isGood = width > 0 && height > 0 && width * height <= device::kMaximumPixels &&
                      device::encodePNG(picture.get(), written) && device::decodePNG(written) != nullptr;
  if (!isGood) std::abort();
  return 0;
}
