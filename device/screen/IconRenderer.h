// Renders home-screen icons.
#pragma once

#include <memory>
#include <optional>
#include <string>

#include "device/screen/IconImage.h"
#include "platform/FileSystem.h"
#include "platform/IconRenderer.h"

namespace appsync::device {

/// Icons are squares of `kIconSize` pixels with rounded corners.
class IconRenderer final : public platform::IconRenderer {
 public:
  static constexpr int kIconSize = 120;
  static constexpr double kCornerRadius = 27;
  /// Larger icon files are not read.
  static constexpr std::uint64_t kMaximumFileSize = 8 << 20;

  /// `fileSystem` must outlive the renderer.
  explicit IconRenderer(platform::FileSystem& fileSystem) : fileSystem_(fileSystem) {}

  /// Renders the PNG file that the bundle's info dictionary names under `kBundleIconFileKey`, a path inside the bundle.
  /// The image is scaled to fill the square and cropped. Returns null if there is no usable file.
  [[nodiscard]] std::unique_ptr<platform::Image> createHomeScreenIconImage(const platform::Bundle& bundle) override;

 private:
  platform::FileSystem& fileSystem_;
};

/// Returns the path of the bundle's icon, or nullopt if the info dictionary names no file inside the bundle.
[[nodiscard]] std::optional<std::string> iconPathIn(const platform::Bundle& bundle);

/// Adds a rectangle with rounded corners and its top left corner at the origin to the path of `context`.
void addRoundedRectangle(cairo_t* context, double width, double height, double cornerRadius);

}  // namespace appsync::device
