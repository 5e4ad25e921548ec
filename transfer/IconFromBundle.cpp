// From an app bundle to a PNG file of its home-screen icon.
#include "core/AppsClient.h"
#include "transfer/ScratchPath.h"

namespace appsync {

bool AppsClient::_makeIconFromBundlePath(platform::Platform& platform, const std::optional<std::string>& bundlePath,
                                         std::string_view destination) {
  const PlugInLog log(platform.syncFramework());
  const auto failed = [&log](PlugInLog::Format<> message) {
    log.error(message);
    return false;
  };
  if (!bundlePath) return failed("%s|missing bundlePath");
  const auto location = platform::FileLocation::directory(*bundlePath);
  if (!location) return failed("%s|couldn't create URL");
  const auto bundle = platform.bundles().openBundle(*location);
  if (!bundle) return failed("%s|couldn't create bundle from URL");
  const auto image = platform.iconRenderer().createHomeScreenIconImage(*bundle);
  if (!image) return failed("%s|couldn't create SV icon from bundle");

  Bytes picture;
  const auto encoder = platform.pngEncoders().createEncoder(picture, 1);
  if (!encoder) return failed("%s|couldn't create image");
  encoder->addImage(*image);
  if (!encoder->finalize()) return failed("%s|Couldn't finalize image");

  if (leavesItsFolder(destination) || !platform.fileSystem().writeFileAtomically(destination, picture)) {
    log.error("%s|Couldn't save image file to %{public}@", destination);
    return false;
  }
  return true;
}

}  // namespace appsync
