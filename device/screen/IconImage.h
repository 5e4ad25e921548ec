// Images, decoded from untrusted PNG files and encoded into new ones.
#pragma once

#include <cstdint>
#include <memory>
#include <utility>

#include <cairo/cairo.h>

#include "base/Bytes.h"
#include "platform/IconRenderer.h"

namespace appsync::device {

struct SurfaceRelease {
  void operator()(cairo_surface_t* surface) const noexcept { cairo_surface_destroy(surface); }
};
using Surface = std::unique_ptr<cairo_surface_t, SurfaceRelease>;

struct ContextRelease {
  void operator()(cairo_t* context) const noexcept { cairo_destroy(context); }
};
using Context = std::unique_ptr<cairo_t, ContextRelease>;

/// An immutable cairo image surface.
class IconImage final : public platform::Image {
 public:
  explicit IconImage(Surface surface) : surface_(std::move(surface)) {}

  /// ARGB, premultiplied.
  [[nodiscard]] cairo_surface_t* surface() const noexcept { return surface_.get(); }

 private:
  Surface surface_;
};

inline constexpr std::uint64_t kMaximumPixels = std::uint64_t{2048} * 2048;

/// Decodes an untrusted PNG file. Returns null if it is not a complete PNG file or has more than `kMaximumPixels`.
/// Memory use is bounded by `kMaximumPixels` and the file's size.
[[nodiscard]] Surface decodePNG(ByteView bytes);

/// Appends the image as a PNG file to `out`. On failure returns false and leaves `out` unspecified.
[[nodiscard]] bool encodePNG(cairo_surface_t* picture, Bytes& out);

}  // namespace appsync::device
