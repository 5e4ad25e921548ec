#include "host/BackupWriter.h"

#include <cerrno>
#include <utility>

#include <fcntl.h>

#include "base/ReturnIfError.h"
#include "device/apps/AppData.h"
#include "device/apps/Demotion.h"
#include "device/screen/IconRenderer.h"
#include "device/storage/FileTree.h"
#include "device/storage/RandomNames.h"
#include "device/storage/SystemCalls.h"
#include "host/AtomicDirectory.h"
#include "host/BackupCheck.h"
#include "host/DeviceApps.h"
#include "platform/Keys.h"

namespace appsync::host {
namespace {

using device::FileDescriptor;
using platform::TSInstallType;

Result<FileDescriptor> makeFolder(int parent, const std::string& name) {
  const int made = device::sys::makeFolder(parent, name.c_str());
  if (made != 0) return Error::fromErrno(made, name);
  FileDescriptor folder(openat(parent, name.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
  if (!folder.valid()) return Error::fromErrno(errno, name);
  return folder;
}

/// Returns the icon file that the app's info dictionary names, or nullopt if it is missing, unreadable or too large.
std::optional<Bytes> iconOf(device::Device& device, const platform::AppRecord& record) {
  const auto folder = record.bundlePath();
  const auto bundle = folder ? device.platform().bundles().openBundle({*folder, true}) : nullptr;
  const auto path = bundle ? device::iconPathIn(*bundle) : std::nullopt;
  if (!path) return std::nullopt;
  const auto attributes = device.platform().fileSystem().attributesOfItem(*path);
  if (!attributes || attributes->size > device::IconRenderer::kMaximumFileSize) return std::nullopt;
  Result<Bytes> bytes = device.platform().fileSystem().readFile(*path);
  return bytes ? std::optional(std::move(bytes).value()) : std::nullopt;
}

std::optional<Bytes> storeMetadataOf(device::Device& device, const platform::AppRecord& record) {
  const std::string path = record.bundleContainerPath().value_or("") + "/" + std::string(backup_files::kStoreMetadata);
  Result<Bytes> bytes = device.platform().fileSystem().readFile(path);
  return bytes ? std::optional(std::move(bytes).value()) : std::nullopt;
}

/// Writes the apps of one device into the directory of a backup.
class AppWriter {
 public:
  AppWriter(device::Device& device, const FileDescriptor& folder) : device_(device), folder_(folder) {}

  [[nodiscard]] Result<BackedUpApp> write(const DeviceApp& app) {
    const std::string& identifier = app.name.identifier;
    BackedUpApp entry;
    entry.name = app.name;
    if (!app.isInstalled && device::isDemotion(app.installType)) entry.demotion = app.installType;
    const auto record =
        device_.platform().defaultRegistry().recordForIdentifier(identifier, platform::PlaceholderLookup::on);
    if (!record) return Error::fromErrno(ENOENT, "the record of " + identifier);
    const Result<FileDescriptor> own = makeFolder(folder_.get(), identifier);
    if (!own) return own.error();
    const Result<std::optional<Bytes>> licence = device_.services().defaultRegistry().licenceData(identifier);
    if (!licence) return licence.error();
    Status written = add(*own, backup_files::kStoreMetadata, storeMetadataOf(device_, *record), entry.storeMetadata);
    if (written) written = add(*own, backup_files::kLicence, *licence, entry.licence);
    if (written) written = add(*own, backup_files::kIcon, iconOf(device_, *record), entry.icon);
    if (written) written = addData(*own, entry);
    if (!written) return written.error();
    return entry;
  }

 private:
  static Status add(const FileDescriptor& folder, std::string_view name, const std::optional<Bytes>& bytes,
                    std::optional<std::uint64_t>& size) {
    if (!bytes) return {};
    size = bytes->size();
    const int error = device::tree::create(folder.get(), std::string(name).c_str(), *bytes);
    return error == 0 ? Status() : Status(Error::fromErrno(error, name));
  }

  /// Adds the app's data or, if it has not been given back yet, the data that an earlier restore keeps for it.
  Status addData(const FileDescriptor& folder, BackedUpApp& entry) {
    const std::string& identifier = entry.name.identifier;
    const bool isKept = device_.platform().makeBackupManager()->restoreDataExists(identifier, nullptr);
    const std::string path =
        isKept ? std::string(device::kRestoreDataPath) + "/" + identifier : device::dataContainerOf(identifier);
    const Result<FileDescriptor> data = device_.services().fileSystem().root().open(path, O_RDONLY | O_DIRECTORY);
    if (!data && data.error().code == ENOENT) return {};
    if (!data) return data.error();
    std::uint64_t bytes = 0;
    const int error = device::tree::copy(data->get(), ".", folder.get(), std::string(backup_files::kData).c_str(),
                                         bytes, &entry.leftOut);
    if (error != 0) return Error::fromErrno(error, "the data of " + identifier);
    entry.data = bytes;
    return {};
  }

  device::Device& device_;
  const FileDescriptor& folder_;
};

bool isToBeSaved(const DeviceApp& app) {
  const bool isBeingSynced = !app.isInstalled && app.installType == TSInstallType::Sync;
  return app.type == platform::kApplicationTypeUser && !isBeingSynced;
}

Status fill(const AtomicDirectory& directory, device::Device& device, Backup& backup) {
  const Result<FileDescriptor> apps = makeFolder(directory.folder(), std::string(backup_files::kApps));
  if (!apps) return apps.error();
  AppWriter writer(device, *apps);
  const Result<std::vector<DeviceApp>> present = appsOn(device);
  if (!present) return present.error();
  for (const DeviceApp& app : *present) {
    if (!isToBeSaved(app)) continue;
    Result<BackedUpApp> written = writer.write(app);
    if (!written) return written.error();
    backup.apps.push_back(std::move(written).value());
  }
  const Result<Bytes> manifest = plist::writeXML(manifestOf(backup));
  if (!manifest) return manifest.error();
  const int error = device::tree::create(directory.folder(), std::string(backup_files::kManifest).c_str(), *manifest);
  return error == 0 ? Status() : Status(Error::fromErrno(error, backup_files::kManifest));
}

}  // namespace

Result<Backup> writeBackup(device::Device& device, const std::string& path) {
  Result<AtomicDirectory> directory = AtomicDirectory::make(path);
  if (!directory) return directory.error();
  Backup backup{path, device::newUUID(), {}, {}};
  const auto order = device.services().homeScreen().iconOrder();
  if (!order) return order.error().in("the order of the icons cannot be read");
  backup.iconOrder = *order;
  if (Status filled = fill(*directory, device, backup); !filled) {
    return filled.error().in(path + " cannot be written and was not created");
  }
  if (Status checked = checkBackup(directory->folderPath(), backup); !checked) {
    return checked.error().in(path + " cannot be read back after it was written and was not created");
  }
  RETURN_IF_ERROR(directory->publish());
  return backup;
}

}  // namespace appsync::host
