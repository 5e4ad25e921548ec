// Draws the whole home screen.
#pragma once

#include <string>
#include <string_view>

#include "base/Error.h"
#include "device/screen/HomeScreen.h"
#include "device/screen/IconRenderer.h"
#include "platform/AppRegistry.h"
#include "platform/Bundle.h"

namespace appsync::device {

/// The services with the content of the screen. They may be those of a read-only device.
struct ScreenServices {
  HomeScreen& homeScreen;
  platform::AppRegistry& registry;
  platform::Bundles& bundles;
  platform::IconRenderer& iconRenderer;
};

/// Error domain of drawing; codes are cairo's.
inline constexpr std::string_view kDrawingDomain = "Drawing";

/// Draws every app in on-screen order, placeholders with their progress, to a PNG file: pages of 4 by 6 icons side by
/// side, scaled down if there are many. Apps without an icon get the first letter of their name on a colour.
///
/// `hostPath` is a path for `writeHostFile`. A failure leaves the file unchanged.
[[nodiscard]] Status drawScreen(const ScreenServices& services, const std::string& hostPath);

}  // namespace appsync::device
