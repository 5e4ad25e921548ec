// Home-screen icons.
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

  /// The PNG file that the bundle's info dictionary names under `kBundleIconFileKey`, a path inside the bundle. The
  /// picture fills the square; what stands over on its longer side is cut off.
  [[nodiscard]] std::unique_ptr<platform::Image> createHomeScreenIconImage(const platform::Bundle& bundle) override;

 private:
  platform::FileSystem& fileSystem_;
};

/// Where the bundle's icon is; none when it names no file inside itself.
[[nodiscard]] std::optional<std::string> iconPathIn(const platform::Bundle& bundle);

/// Adds to `context`'s path a rectangle with rounded corners, its top left one at the origin.
void addRoundedRectangle(cairo_t* context, double width, double height, double cornerRadius);

}  // namespace appsync::device
