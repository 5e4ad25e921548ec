// Draws one icon of the home screen.
#pragma once

#include <cstdint>
#include <string>

#include <cairo/cairo.h>

namespace appsync::device {

/// The state of an app's install.
enum class IconState : std::uint8_t {
  installed,  ///< undecorated
  waiting,    ///< dimmed, with an empty ring
  running,    ///< dimmed, with a partly filled ring
  paused,     ///< like `running`, with a pause sign
};

struct ScreenIcon {
  std::string bundleIdentifier;
  std::string name;
  /// A square of `IconRenderer::kIconSize`, not owned. If null, the name's first letter is drawn on a colour that
  /// depends on the identifier only.
  cairo_surface_t* picture = nullptr;
  IconState state = IconState::installed;
  double fraction = 0;  ///< of the ring, 0 to 1
};

/// Draws the icon with its top left corner at the origin and its name, truncated to `width`, under it.
void drawScreenIcon(cairo_t* context, const ScreenIcon& icon, double width);

}  // namespace appsync::device
