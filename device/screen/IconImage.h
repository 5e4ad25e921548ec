// Pictures, and how they come from PNG files that nobody vouches for and go into new ones.
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

/// A picture of cairo's. Its pixels no longer change.
class IconImage final : public platform::Image {
 public:
  explicit IconImage(Surface surface) : surface_(std::move(surface)) {}

  /// ARGB, premultiplied.
  [[nodiscard]] cairo_surface_t* surface() const noexcept { return surface_.get(); }

 private:
  Surface surface_;
};

inline constexpr std::uint64_t kMaximumPixels = std::uint64_t{2048} * 2048;

/// The picture in a PNG file; null for what is no whole PNG and for one of more than `kMaximumPixels`. Memory is in
/// proportion to that bound and to the file, whatever the file claims.
[[nodiscard]] Surface decodePNG(ByteView bytes);

/// Appends the picture as a PNG file to `out`; false, and `out` is of no use, when it cannot be encoded.
[[nodiscard]] bool encodePNG(cairo_surface_t* picture, Bytes& out);

}  // namespace appsync::device
