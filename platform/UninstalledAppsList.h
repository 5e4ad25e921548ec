// The installer's memory of removed apps.
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "plist/PropertyList.h"

namespace appsync::platform {

/// Real apps that were removed from the device, by whomever, and not cleared since. Installing an app again takes it
/// off. Outlives the process. Threads: any.
class UninstalledAppsList {
 public:
  virtual ~UninstalledAppsList() = default;

  /// The removed apps by bundle identifier; the values are the installer's own. Nothing when the list cannot be had.
  /// The caller owns the answer.
  [[nodiscard]] virtual std::optional<plist::Dictionary> lookupUninstalled() = 0;

  /// Takes these identifiers off; unknown ones do not matter. All or none. Returns 0, or an error number.
  [[nodiscard]] virtual int clearUninstalled(const std::vector<std::string>& bundleIdentifiers) = 0;
};

}  // namespace appsync::platform
