#include "host/StagingArea.h"

#include <algorithm>
#include <set>

#include "device/packages/Package.h"
#include "host/Parallel.h"
#include "platform/SyncFiles.h"

namespace appsync::host {
namespace {

using platform::FileSystem;
using platform::IntermediateDirectories;

std::string stagedPath(std::string_view name) {
  return std::string(kStagingFolder) + "/" + std::string(name);
}

/// Returns the staging path of the file that the plug-in will find at `path` in its work area.
std::string stagedFor(std::string_view path) {
  return stagedPath(path.substr(kWorkArea.size() + 1));
}

bool isTransfer(const PlannedApp& planned) {
  return planned.package != nullptr;
}

plist::Value todoEntry(const PlannedApp& planned) {
  plist::Dictionary entry = {{todo::kIdentifier, planned.name.identifier}};
  entry.set(todo::kOperation, isTransfer(planned) ? todo::kInstall : todo::kRemove);
  if (isTransfer(planned) && !planned.name.version.empty()) entry.set(todo::kVersion, planned.name.version);
  if (isTransfer(planned) && !planned.name.name.empty()) entry.set(todo::kName, planned.name.name);
  return entry;
}

plist::Array todoList(const std::vector<PlannedApp>& plan) {
  plist::Array list;
  for (const PlannedApp& planned : plan) {
    if (isTransfer(planned) || planned.work == PlannedWork::remove) list.push_back(todoEntry(planned));
  }
  return list;
}

/// Returns the present icon order without removed apps, followed by the new apps.
plist::Array iconLayout(device::Device& device, const std::vector<PlannedApp>& plan) {
  std::set<std::string_view> removed;
  for (const PlannedApp& planned : plan) {
    if (planned.work == PlannedWork::remove) removed.insert(planned.name.identifier);
  }
  plist::Array layout;
  std::set<std::string> present;
  if (const auto order = device.services().homeScreen().iconOrder()) {
    for (const std::string& identifier : *order) {
      if (!removed.contains(identifier) && present.insert(identifier).second) layout.emplace_back(identifier);
    }
  }
  for (const PlannedApp& planned : plan) {
    if (isTransfer(planned) && present.insert(planned.name.identifier).second)
      layout.emplace_back(planned.name.identifier);
  }
  return layout;
}

Status writeList(FileSystem& files, const std::string& path, const plist::Value& root) {
  const Result<Bytes> bytes = plist::writeBinary(root);
  return bytes ? files.createFile(path, *bytes, {}) : Status(bytes.error());
}

/// Sets the icon's staged name in the staged info dictionary: its name in the package may be any path.
Status stageAppFiles(FileSystem& files, const std::string& folder, device::PackageInfo package) {
  if (package.icon) package.info.set(platform::kBundleIconFileKey, kPlaceholderIconName);
  const Result<Bytes> info = plist::writeBinary(package.info);
  if (!info) return info.error();
  Status made = files.createDirectory(folder, IntermediateDirectories::create, {});
  const auto add = [&](std::string_view name, const std::optional<Bytes>& bytes) {
    if (made && bytes) made = files.createFile(folder + "/" + std::string(name), *bytes, {});
  };
  add(kInfoPlistName, *info);
  add(kPlaceholderIconName, package.icon);
  add(kStoreMetadataName, package.storeMetadata);
  add(kArtworkName, package.artwork);
  return made;
}

Status stageApp(FileSystem& files, const PlannedApp& planned) {
  Result<device::PackageInfo> package = device::readPackageInfo(planned.package->path);
  return package ? stageAppFiles(files, stagedPath(planned.name.identifier), *std::move(package)) : Status();
}

/// Stages the apps in parallel. Returns the first failure in the plan's order.
Status stageApps(FileSystem& files, const std::vector<PlannedApp>& plan) {
  std::vector<Status> staged(plan.size());
  inParallel(plan.size(), [&](std::size_t number) {
    if (isTransfer(plan[number])) staged[number] = stageApp(files, plan[number]);
  });
  const auto failed = std::ranges::find_if(staged, [](const Status& one) { return !one.ok(); });
  return failed == staged.end() ? Status() : *failed;
}

}  // namespace

Status stage(device::Device& device, const std::vector<PlannedApp>& plan) {
  FileSystem& files = device.platform().fileSystem();
  clearStaging(device);
  Status staged = files.createDirectory(kStagingFolder, IntermediateDirectories::create, {});
  if (staged) staged = stageApps(files, plan);
  if (staged) staged = writeList(files, stagedFor(kIconLayoutPath), iconLayout(device, plan));
  if (staged) staged = writeList(files, stagedFor(kTodoListPath), todoList(plan));
  if (!staged) clearStaging(device);
  return staged;
}

void clearStaging(device::Device& device) {
  FileSystem& files = device.platform().fileSystem();
  files.removeItem(kStagingFolder).ignore();
  files.removeItem(std::string(kPublicStaging) + "/" + std::string(kPackagesFolder)).ignore();
}

}  // namespace appsync::host
