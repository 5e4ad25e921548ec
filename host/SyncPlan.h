// What is to be done with each app in a sync.
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
  restore,  ///< the device's store brings the package
  none,     ///< the app is as it should be
  skip,     ///< left alone on purpose
  refuse,   ///< cannot be done
};

struct PlannedApp {
  AppName app;
  PlannedWork work = PlannedWork::none;
  const LibraryPackage* package = nullptr;  ///< of installs and updates
  std::string reason;                       ///< why nothing is done; of a removal, why the app may stay
};

struct PlanInput {
  const Library& library;
  /// By identifier.
  const std::map<std::string, DeviceApp, std::less<>>& deviceApps;
  const IdentifierSet& declined;
  /// When not empty, the only apps that are installed or updated.
  const IdentifierSet& only;
  const IdentifierSet& remove;
  /// Restored apps whose packages are the device's store's to bring.
  const IdentifierSet& fromStore;
};

/// One entry for each app concerned: first the removals, then restored apps whose packages the library does not bring,
/// then the library's apps by identifier, then its broken packages. The packages stay the library's.
[[nodiscard]] std::vector<PlannedApp> makePlan(const PlanInput& input);

}  // namespace appsync::host
