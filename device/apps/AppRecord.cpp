#include "device/apps/AppRecord.h"

namespace appsync::device {

namespace {

std::string containerPath(const StoredBundle& bundle) {
  return std::string(kContainersPath) + '/' + bundle.container;
}

}  // namespace

const StoredBundle* AppRecord::bundle() const {
  if (row_.installed) return &*row_.installed;
  return row_.placeholder ? &*row_.placeholder : nullptr;
}

std::optional<std::string> AppRecord::bundleVersion() const {
  return bundle() == nullptr ? std::nullopt : bundle()->version;
}

std::optional<std::string> AppRecord::bundleContainerPath() const {
  if (bundle() == nullptr) return std::nullopt;
  return containerPath(*bundle());
}

std::optional<std::string> AppRecord::bundlePath() const {
  if (bundle() == nullptr) return std::nullopt;
  return containerPath(*bundle()) + '/' + bundle()->folder;
}

std::uint64_t AppRecord::staticDiskUsage() const {
  return bundle() == nullptr ? 0 : bundle()->bytes;
}

platform::TSInstallType AppRecord::installType() const {
  if (row_.placeholder) return row_.placeholder->installType;
  return row_.installed ? row_.installed->installType : platform::TSInstallType::None;
}

std::string AppRecord::description() const {
  std::string text = row_.identifier;
  if (const auto version = bundleVersion()) text += ' ' + *version;
  if (isInstalled() && isPlaceholder()) return text + " (installed, placeholder)";
  if (isInstalled()) return text + " (installed)";
  return text + (isPlaceholder() ? " (placeholder)" : " (new)");
}

std::string AppRecord::name() const {
  return bundle() == nullptr ? row_.identifier : bundle()->name;
}

std::optional<double> AppRecord::installedAt() const {
  if (bundle() == nullptr) return std::nullopt;
  return bundle()->installedAt;
}

}  // namespace appsync::device
