#include "device/packages/Package.h"

#include <cerrno>
#include <functional>
#include <utility>

#include <fcntl.h>

#include "base/ReturnIfError.h"
#include "device/packages/BundleInfo.h"
#include "device/packages/InstallerError.h"
#include "platform/SyncFiles.h"
#include "plist/Access.h"

namespace appsync::device {

namespace {

Result<PackageReader> openPackage(const std::string& hostPath, PackageLimits limits) {
  FileDescriptor file(::open(hostPath.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC));
  if (!file.valid()) return Error::fromErrno(errno);
  return PackageReader::open(std::move(file), limits);
}

/// Reads a whole package. `wanted` returns the destination of an entry's content, or null to skip it.
Status collect(PackageReader& package,
               const std::function<std::optional<Bytes>*(const PackageReader::Entry&)>& wanted) {
  PackageReader::Entry entry;
  for (;;) {
    const Result<bool> more = package.next(entry);
    if (!more) return more.error();
    if (!*more) return {};
    std::optional<Bytes>* destination = entry.kind == PackageReader::Kind::file ? wanted(entry) : nullptr;
    if (destination == nullptr) continue;
    Result<Bytes> bytes = package.readAll(kMaximumMetadataBytes);
    if (!bytes) return bytes.error();
    *destination = std::move(bytes).value();
  }
}

Status readIcon(const std::string& hostPath, const std::string& iconPath, PackageLimits limits, PackageInfo& info) {
  Result<PackageReader> package = openPackage(hostPath, limits);
  if (!package) return package.error();
  return collect(*package,
                 [&](const PackageReader::Entry& entry) { return entry.path == iconPath ? &info.icon : nullptr; });
}

Result<PackageInfo> readInfo(const std::string& hostPath, PackageLimits limits) {
  Result<PackageReader> package = openPackage(hostPath, limits);
  if (!package) return package.error();
  PackageInfo info;
  std::optional<Bytes> document;
  const Status walked = collect(*package, [&](const PackageReader::Entry& entry) -> std::optional<Bytes>* {
    if (entry.path == kStoreMetadataName) return &info.storeMetadata;
    if (entry.path == kArtworkName) return &info.artwork;
    return isInfoFile(entry.path, package->appFolder()) ? &document : nullptr;
  });
  if (!walked) return walked.error();
  if (!document) return missingInfo(package->appFolder());
  Result<BundleInfo> bundle = readBundleInfo(*document);
  if (!bundle) return bundle.error();
  info.identifier = std::move(bundle->identifier);
  info.version = std::move(bundle->version);
  info.name = bundle->displayName ? *std::move(bundle->displayName) : std::string(appFolderStem(package->appFolder()));
  info.info = std::move(bundle->dictionary);
  info.packageBytes = package->packageBytes();
  const auto iconName = stringIn(info.info.find(platform::kBundleIconFileKey));
  if (!iconName || iconName->empty()) return info;
  RETURN_IF_ERROR(readIcon(hostPath, package->appFolder() + '/' + std::string(*iconName), limits, info));
  return info;
}

}  // namespace

Result<PackageInfo> readPackageInfo(const std::string& hostPath, PackageLimits limits) {
  Result<PackageInfo> info = readInfo(hostPath, limits);
  if (!info) return info.error().in(hostPath);
  return info;
}

}  // namespace appsync::device
