// What the plug-in does through the install-coordination service on its own account.
#pragma once

#include <string_view>

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

  /// uninstallAppUsingCoordination: asks for the removal and returns at once; its outcome is only logged.
  virtual void uninstallAppUsingCoordination(std::string_view bundleIdentifier) = 0;
};

}  // namespace appsync
