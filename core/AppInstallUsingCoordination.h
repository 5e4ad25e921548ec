// What the plug-in does through the install-coordination service on its own account.
#pragma once

#include <optional>
#include <string_view>

#include "base/Bytes.h"
#include "common/DemotionStatus.h"
#include "platform/ZTAsset.h"

namespace appsync {

/// For devices that install through coordinators. Nothing is passed on but yes or no; the log says the rest.
class AppInstallUsingCoordination {
 public:
  virtual ~AppInstallUsingCoordination() = default;

  /// prepareAppForInstallUsingCoordination:existingApp: makes everything ready for the asset's package to come:
  /// coordinator, options, promises and, on the home screen, a placeholder. What is ready already stays. False when it
  /// could not be done or the app is another client's; then nothing of the plug-in's own is left.
  virtual bool prepareAppForInstallUsingCoordination(const platform::ZTAsset& asset, bool existingApp) = 0;

  /// prepareAppForRestoreUsingCoordination:harvoMetadata:sinfData:iconData:demotionStatus: the same for an app that a
  /// backup held: its store metadata, and its licence and icon if there were any. The store brings its package, unless
  /// it was demoted. Its placeholder is awaited from then on.
  virtual bool prepareAppForRestoreUsingCoordination(std::string_view bundleIdentifier, ByteView harvoMetadata,
                                                     const std::optional<ByteView>& sinfData,
                                                     const std::optional<ByteView>& iconData,
                                                     DemotionStatus demotionStatus) = 0;

  /// uninstallAppUsingCoordination: asks for the removal and returns at once; its outcome is only logged.
  virtual void uninstallAppUsingCoordination(std::string_view bundleIdentifier) = 0;
};

}  // namespace appsync
