#include "host/SyncPlan.h"

#include <compare>

#include "device/apps/AppTable.h"
#include "host/VersionOrder.h"

namespace appsync::host {
namespace {

PlannedApp planRemoval(const std::string& identifier, const PlanInput& input) {
  const auto found = input.deviceApps.find(identifier);
  if (found == input.deviceApps.end()) {
    return {{identifier, {}, {}}, PlannedWork::skip, nullptr, "it is not on the device"};
  }
  const DeviceApp& present = found->second;
  if (present.isInstalled && present.isPlaceholder) {
    return {present.name, PlannedWork::remove, nullptr,
            "only its placeholder was removed; run the sync again to remove the app"};
  }
  return {present.name, PlannedWork::remove, nullptr, "the device could not remove it; see `appsync history`"};
}

/// Plans an app that is installed: an update if the library has a newer version.
PlannedApp planUpdate(const LibraryPackage& package, const DeviceApp& present) {
  const auto order = compareVersions(package.name.version, present.name.version);
  if (std::is_gt(order)) return {package.name, PlannedWork::update, &package, {}};
  if (std::is_eq(order)) return {present.name, PlannedWork::none, nullptr, "it is up to date"};
  return {present.name, PlannedWork::skip, nullptr,
          "the device has the newer version " + present.name.version + ", the library " + package.name.version};
}

/// A demoted app whose reinstallation was requested counts as any other app until that has ended.
bool isDemoted(const DeviceApp& app) {
  return !app.isInstalled && !app.isUnderWay && device::isDemotion(app.installType);
}

PlannedApp planPackage(const LibraryPackage& package, const PlanInput& input) {
  const std::string& identifier = package.name.identifier;
  const auto present = input.deviceApps.find(identifier);
  if (present != input.deviceApps.end() && present->second.isInstalled) return planUpdate(package, present->second);
  if (present != input.deviceApps.end() && isDemoted(present->second) && !input.only.contains(identifier)) {
    return {present->second.name, PlannedWork::skip, nullptr,
            "it is demoted: the device keeps only its icon and data; use --only to install it again"};
  }
  if (input.declined.contains(identifier) && !input.only.contains(identifier)) {
    return {package.name, PlannedWork::skip, nullptr, "it was removed from the device; use --only to install it again"};
  }
  return {package.name, PlannedWork::install, &package, {}};
}

bool isSelected(const std::string& identifier, const PlanInput& input) {
  return !input.remove.contains(identifier) && (input.only.empty() || input.only.contains(identifier));
}

/// Plans restored apps that wait for their packages and are not in the library.
void planRestores(const PlanInput& input, std::vector<PlannedApp>& plan) {
  for (const auto& [identifier, present] : input.deviceApps) {
    if (present.isInstalled || !isSelected(identifier, input)) continue;
    if (input.fromStore.contains(identifier)) {
      plan.push_back({present.name, PlannedWork::restore, nullptr, {}});
      continue;
    }
    const bool isRestored = present.isPlaceholder && present.installType == platform::TSInstallType::Restore;
    if (!isRestored || !input.only.empty() || input.library.packages.contains(identifier)) continue;
    plan.push_back(
        {present.name, PlannedWork::refuse, nullptr, "it was restored, but the library has no package of it; add one"});
  }
}

}  // namespace

std::vector<PlannedApp> makePlan(const PlanInput& input) {
  std::vector<PlannedApp> plan;
  for (const std::string& identifier : input.remove)
    plan.push_back(planRemoval(identifier, input));
  planRestores(input, plan);
  for (const auto& [identifier, package] : input.library.packages) {
    if (isSelected(identifier, input) && !input.fromStore.contains(identifier))
      plan.push_back(planPackage(package, input));
  }
  for (const std::string& identifier : input.only) {
    if (input.library.packages.contains(identifier) || input.fromStore.contains(identifier)) continue;
    plan.push_back({{identifier, {}, {}}, PlannedWork::refuse, nullptr, "the library has no package of this app"});
  }
  if (!input.only.empty()) return plan;
  for (const BrokenPackage& broken : input.library.broken) {
    plan.push_back({{broken.fileName, {}, {}, NameKind::packageFile}, PlannedWork::refuse, nullptr, broken.reason});
  }
  return plan;
}

}  // namespace appsync::host
