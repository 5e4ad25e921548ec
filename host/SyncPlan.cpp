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
    return {present.app, PlannedWork::remove, nullptr,
            "its placeholder was removed instead; ask again to remove the app"};
  }
  return {present.app, PlannedWork::remove, nullptr, "the device could not remove it; `appsync history` may tell why"};
}

/// The app is on the device; whether the library has something newer for it.
PlannedApp planUpdate(const LibraryPackage& package, const DeviceApp& present) {
  const auto order = compareVersions(package.app.version, present.app.version);
  if (std::is_gt(order)) return {package.app, PlannedWork::update, &package, {}};
  if (std::is_eq(order)) return {present.app, PlannedWork::none, nullptr, "it is up to date"};
  return {present.app, PlannedWork::skip, nullptr,
          "the device has the newer version " + present.app.version + ", the library " + package.app.version};
}

/// Once it was asked for, and until that has ended, it is sent as any other.
bool isDemoted(const DeviceApp& app) {
  return !app.isInstalled && !app.isUnderWay && device::isDemotion(app.installType);
}

PlannedApp planPackage(const LibraryPackage& package, const PlanInput& input) {
  const std::string& identifier = package.app.identifier;
  const auto present = input.deviceApps.find(identifier);
  if (present != input.deviceApps.end() && present->second.isInstalled) return planUpdate(package, present->second);
  if (present != input.deviceApps.end() && isDemoted(present->second) && !input.only.contains(identifier)) {
    return {present->second.app, PlannedWork::skip, nullptr,
            "it is demoted: the device keeps its icon and data only; ask for it with --only to have it again"};
  }
  if (input.declined.contains(identifier) && !input.only.contains(identifier)) {
    return {package.app, PlannedWork::skip, nullptr,
            "it was removed from the device; ask for it with --only to have it again"};
  }
  return {package.app, PlannedWork::install, &package, {}};
}

bool isConcerned(const std::string& identifier, const PlanInput& input) {
  return !input.remove.contains(identifier) && (input.only.empty() || input.only.contains(identifier));
}

/// Restored apps that still wait for their packages, unless the library has them.
void planRestores(const PlanInput& input, std::vector<PlannedApp>& plan) {
  for (const auto& [identifier, present] : input.deviceApps) {
    if (present.isInstalled || !isConcerned(identifier, input)) continue;
    if (input.fromStore.contains(identifier)) {
      plan.push_back({present.app, PlannedWork::restore, nullptr, {}});
      continue;
    }
    const bool isRestored = present.isPlaceholder && present.installType == platform::TSInstallType::Restore;
    if (!isRestored || !input.only.empty() || input.library.packages.contains(identifier)) continue;
    plan.push_back({present.app, PlannedWork::refuse, nullptr,
                    "it was restored and waits for its package, which the library does not have"});
  }
}

}  // namespace

std::vector<PlannedApp> makePlan(const PlanInput& input) {
  std::vector<PlannedApp> plan;
  for (const std::string& identifier : input.remove)
    plan.push_back(planRemoval(identifier, input));
  planRestores(input, plan);
  for (const auto& [identifier, package] : input.library.packages) {
    if (isConcerned(identifier, input) && !input.fromStore.contains(identifier))
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
