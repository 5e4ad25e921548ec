#include "daemon/InstallsOnDevice.h"

#include <algorithm>

namespace appsync::daemon {

using platform::PlaceholderLookup;

double showInstall(device::Device& device, const std::string& identifier, host::SyncProgress& progress) {
  platform::AppRegistry& registry = device.platform().defaultRegistry();
  const auto record = registry.recordForIdentifier(identifier, PlaceholderLookup::on);
  const auto install =
      record ? registry.installProgressForApplication(*record, platform::TSInstallPhase::Installing) : nullptr;
  if (!install || install->installPhase() != platform::TSInstallPhase::Installing) return 0;
  if (install->totalUnitCount() <= 0) return 0;
  const double units = static_cast<double>(install->totalUnitCount());
  const double fraction = std::clamp(static_cast<double>(install->completedUnitCount()) / units, 0.0, 1.0);
  progress.installing(identifier, fraction);
  return fraction;
}

host::AppOutcome outcomeOnDevice(device::Device& device, const PendingInstall& package) {
  platform::AppRegistry& registry = device.platform().defaultRegistry();
  const auto record = registry.recordForIdentifier(package.name.identifier, PlaceholderLookup::on);
  // After a failed update the earlier version is installed.
  const bool hasVersion = record && record->bundleVersion().value_or("") == package.name.version;
  if (hasVersion && record->isInstalled() && !record->isPlaceholder()) return {package.success, package.name, {}};
  const auto failure = device.services().defaultRegistry().lastInstallFailure(package.name.identifier);
  return {host::AppEvent::failed, package.name, failure ? failure->text : "the device did not install it"};
}

}  // namespace appsync::daemon
