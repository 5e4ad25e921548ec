// A picture of the whole home screen.
#pragma once

#include <string>
#include <string_view>

#include "base/Error.h"
#include "device/screen/HomeScreen.h"
#include "device/screen/IconRenderer.h"
#include "platform/AppRegistry.h"
#include "platform/Bundle.h"

namespace appsync::device {

/// The services that know what stands on the screen. Readers of the device are enough.
struct ScreenServices {
  HomeScreen& homeScreen;
  platform::AppRegistry& registry;
  platform::Bundles& bundles;
  platform::IconRenderer& iconRenderer;
};

/// Error domain of drawing; codes are cairo's.
inline constexpr std::string_view kDrawingDomain = "Drawing";

/// Draws every app, placeholders with their progress, in on-screen order to a PNG file: pages of 4 by 6 icons side by
/// side, made smaller when there are many of them. An app without an icon gets its first letter on a colour of its own.
///
/// `hostPath` is a place as `writeHostFile` takes it; after a failure it is as it was.
[[nodiscard]] Status drawScreen(const ScreenServices& services, const std::string& hostPath);

}  // namespace appsync::device
