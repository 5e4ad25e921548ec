#include "device/apps/PlaceholderBundle.h"

#include <cerrno>
#include <chrono>
#include <optional>
#include <string>
#include <utility>

#include <fcntl.h>

#include "base/ReturnIfError.h"
#include "device/packages/BundleInfo.h"
#include "device/packages/PackageReader.h"
#include "device/storage/FileTree.h"
#include "device/storage/SystemCalls.h"
#include "platform/Keys.h"
#include "platform/SyncFiles.h"
#include "plist/Access.h"
#include "plist/PropertyList.h"

namespace appsync::device {

namespace {

std::optional<Bytes> readIcon(DeviceFileSystem& files, const PlaceholderContents& contents) {
  if (!contents.iconPath) return std::nullopt;
  const Result<FileDescriptor> file = files.root().open(*contents.iconPath, O_RDONLY | O_NONBLOCK);
  Bytes bytes;
  if (!file || tree::read(file->get(), kMaximumMetadataBytes, bytes) != 0) return std::nullopt;
  return bytes;
}

const std::string& shownName(const PlaceholderContents& contents) {
  return contents.bundleName.empty() ? contents.identifier : contents.bundleName;
}

std::optional<std::string> versionOf(const PlaceholderContents& contents) {
  if (contents.attributes.bundleVersion()) return contents.attributes.bundleVersion();
  return ownedStringIn(contents.attributes.infoDictionary().find(platform::kBundleVersionKey));
}

/// Returns the app's info dictionary with the placeholder's values.
Result<Bytes> infoDocument(const PlaceholderContents& contents, const StoredBundle& bundle, bool hasIcon) {
  plist::Dictionary info = contents.attributes.infoDictionary();
  info.set(platform::BundleIdentifierKey, contents.identifier);
  info.set(platform::kBundleDisplayNameKey, bundle.name);
  info.set(platform::kBundleExecutableKey, bundle.name);
  info.set(kLaunchProhibitedKey, contents.attributes.launchProhibited());
  if (bundle.version) info.set(platform::kBundleVersionKey, *bundle.version);
  if (hasIcon) {
    info.set(platform::kBundleIconFileKey, kPlaceholderIconName);
  } else {
    info.erase(platform::kBundleIconFileKey);
  }
  return plist::writeBinary(info);
}

Status writeApp(const PendingContainer& container, const std::string& folder, ByteView info,
                const std::optional<Bytes>& icon) {
  int error = sys::makeFolder(container.folder(), folder.c_str());
  if (error != 0) return Error::fromErrno(error, folder);
  const FileDescriptor app(openat(container.folder(), folder.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
  if (!app.valid()) return Error::fromErrno(errno, folder);
  error = tree::create(app.get(), std::string(kInfoPlistName).c_str(), info);
  if (error == 0 && icon) error = tree::create(app.get(), std::string(kPlaceholderIconName).c_str(), *icon);
  if (error != 0) return Error::fromErrno(error, folder);
  return {};
}

}  // namespace

Result<PlaceholderContainer> makePlaceholder(DeviceFileSystem& files, const PlaceholderContents& contents) {
  const std::optional<Bytes> icon = readIcon(files, contents);
  StoredBundle bundle;
  bundle.folder = contents.identifier + ".app";
  bundle.name = shownName(contents);
  bundle.version = versionOf(contents);
  bundle.installType = contents.installType;
  bundle.installedAt = std::chrono::duration<double>(std::chrono::system_clock::now().time_since_epoch()).count();
  const Result<Bytes> info = infoDocument(contents, bundle, icon.has_value());
  if (!info) return info.error().in("the placeholder's Info.plist");
  bundle.bytes = info->size() + (icon ? icon->size() : 0);
  Result<PendingContainer> container = PendingContainer::make(files);
  if (!container) return container.error();
  RETURN_IF_ERROR(writeApp(*container, bundle.folder, *info, icon));
  if (contents.storeMetadata) {
    RETURN_IF_ERROR(container->writeFile(kStoreMetadataName, *contents.storeMetadata));
  }
  return PlaceholderContainer{std::move(container).value(), std::move(bundle)};
}

}  // namespace appsync::device
