// One icon of the home screen's picture.
#pragma once

#include <cstdint>
#include <string>

#include <cairo/cairo.h>

namespace appsync::device {

/// How an app's install is shown on its icon.
enum class IconState : std::uint8_t {
  installed,  ///< not at all
  waiting,    ///< dimmed, with an empty ring
  running,    ///< dimmed, with a ring that fills
  paused,     ///< the same with a pause sign in it
};

struct ScreenIcon {
  std::string bundleIdentifier;
  std::string name;
  /// A square of `IconRenderer::kIconSize`; null for a letter on a colour that stays the same for the identifier. Not
  /// owned.
  cairo_surface_t* picture = nullptr;
  IconState state = IconState::installed;
  double fraction = 0;  ///< of the ring, 0 to 1
};

/// Draws the icon with its top left corner at the origin, and its name under it. `width` is the room for the name,
/// which is cut short to fit.
void drawScreenIcon(cairo_t* context, const ScreenIcon& icon, double width);

}  // namespace appsync::device
