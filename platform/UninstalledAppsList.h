// The installer's list of removed apps.
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "plist/PropertyList.h"

namespace appsync::platform {

/// Installed apps that were removed from the device, by any client, and not cleared since. Reinstalling an app removes
/// it from the list; removed placeholders are never in it. Persistent. Thread-safe.
class UninstalledAppsList {
 public:
  virtual ~UninstalledAppsList() = default;

  /// Returns the removed apps; keys are bundle identifiers, values are defined by the installer. Returns nullopt if the
  /// list is not available.
  [[nodiscard]] virtual std::optional<plist::Dictionary> lookupUninstalled() = 0;

  /// Removes these identifiers from the list; ignores unknown ones. Atomic. Returns 0, or an error number on failure.
  [[nodiscard]] virtual int clearUninstalled(const std::vector<std::string>& bundleIdentifiers) = 0;
};

}  // namespace appsync::platform
