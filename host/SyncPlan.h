// The planned work of a sync for each app.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <vector>

#include "host/AppOutcome.h"
#include "host/DeviceApps.h"
#include "host/HostState.h"
#include "host/Library.h"

namespace appsync::host {

enum class PlannedWork : std::uint8_t {
  install,
  update,
  remove,
  restore,  ///< the device's store delivers the package
  none,     ///< the app is up to date
  skip,     ///< deliberately left as it is
  refuse,   ///< cannot be done
};

struct PlannedApp {
  AppName name;
  PlannedWork work = PlannedWork::none;
  const LibraryPackage* package = nullptr;  ///< null except for installs and updates
  std::string reason;                       ///< why nothing is done; for a removal, the reason if the app stays
};

struct PlanInput {
  const Library& library;
  /// By identifier.
  const std::map<std::string, DeviceApp, std::less<>>& deviceApps;
  const IdentifierSet& declined;
  /// If not empty, the only apps to install or update.
  const IdentifierSet& only;
  const IdentifierSet& remove;
  /// Restored apps whose packages the device's store delivers.
  const IdentifierSet& fromStore;
};

/// Returns one entry for each affected app: first the removals, then restored apps whose packages are not in the
/// library, then the library's apps by identifier, then its broken packages. Entries point to the library's packages.
[[nodiscard]] std::vector<PlannedApp> makePlan(const PlanInput& input);

}  // namespace appsync::host
