#include "device/apps/Installer.h"

#include <chrono>
#include <utility>
#include <vector>

#include <fcntl.h>

#include "base/ReturnIfError.h"
#include "device/apps/AppData.h"
#include "device/apps/UninstalledApps.h"
#include "device/packages/InstallerError.h"
#include "device/packages/PackageUnpacker.h"
#include "device/storage/Database.h"
#include "device/storage/FileTree.h"
#include "platform/SyncFiles.h"

namespace appsync::device {

using platform::TSInstallPhase;
using platform::TSInstallState;
using platform::TSInstallType;

namespace {

/// The total units of an install's progress.
constexpr std::int64_t kProgressUnits = 1000;

double secondsSince1970() {
  return std::chrono::duration<double>(std::chrono::system_clock::now().time_since_epoch()).count();
}

Status checkIdentifier(const BundleInfo& info, const InstallRequest& request) {
  if (info.identifier == request.identifier) return {};
  return installerError(InstallerFailure::identifierMismatch, "this is the app \"" + info.identifier + "\" and not \"" +
                                                                  request.identifier + "\"; ask for the one it is");
}

StoredBundle describe(const BundleInfo& info, const std::string& folder, std::uint64_t bytes) {
  StoredBundle bundle;
  bundle.folder = folder;
  bundle.name = info.displayName ? *info.displayName : std::string(appFolderStem(folder));
  bundle.version = info.version;
  bundle.bytes = bytes;
  bundle.installedAt = secondsSince1970();
  return bundle;
}

/// Reads the "Info.plist" of an app folder in a container.
Result<BundleInfo> readInfoOf(int container, const std::string& appFolder) {
  FileDescriptor file;
  const std::string path = appFolder + '/' + std::string(kInfoPlistName);
  int error = openBeneath(container, path, O_RDONLY | O_NONBLOCK, 0, Resolution::kernel, file);
  Bytes document;
  if (error == 0) error = tree::read(file.get(), kMaximumMetadataBytes, document);
  if (error == ENOENT) return missingInfo(appFolder);
  if (error != 0) return Error::fromErrno(error, path);
  return readBundleInfo(document);
}

/// Writes the requested store metadata next to the app folder.
Status keepStoreMetadata(PendingContainer& container, const InstallRequest& request) {
  if (request.storeMetadata) return container.writeFile(kStoreMetadataName, *request.storeMetadata);
  const std::string name(kStoreMetadataName);
  const bool hasOwn = faccessat(container.folder(), name.c_str(), F_OK, AT_SYMLINK_NOFOLLOW) == 0;
  if (hasOwn || !request.defaultStoreMetadata) return {};
  return container.writeFile(name, *request.defaultStoreMetadata);
}

/// Returns the bundles that a new one replaces: an installed bundle replaces both, a placeholder only a placeholder.
std::vector<const StoredBundle*> replacedBy(BundleRole role, const AppRow& app) {
  std::vector<const StoredBundle*> replaced;
  if (role == BundleRole::installed && app.installed) replaced.push_back(&*app.installed);
  if (app.placeholder) replaced.push_back(&*app.placeholder);
  return replaced;
}

/// Returns what a removal may remove at most: a placeholder alone, or all that belongs to the app.
BundleRole requestedRole(const plist::Dictionary& options) {
  const plist::Value* only = options.find(platform::kUninstallPlaceholdersOnlyKey);
  return only != nullptr && plist::truth(*only).value_or(false) ? BundleRole::placeholder : BundleRole::installed;
}

/// Returns what the removal removes. A placeholder protects the app under it, whose update may have failed.
BundleRole removedRole(BundleRole requested, const AppRow& app) {
  return app.installed && app.placeholder ? BundleRole::placeholder : requested;
}

/// The replaced container is deleted right after this transaction. If it held an app or a lasting placeholder, the
/// transaction must first be durable: after a power failure the old record must not reappear without its files.
Durability durabilityFor(BundleRole role, const AppRow& app) {
  const bool replacesApp = role == BundleRole::installed && app.installed;
  const bool replacesLastingPlaceholder = app.placeholder && app.placeholder->installType != TSInstallType::Sync;
  return replacesApp || replacesLastingPlaceholder ? Durability::power : Durability::process;
}

}  // namespace

Result<AppRow> Installer::known(std::string_view identifier) {
  Database::Session session(database_);
  Result<std::optional<AppRow>> found = app_table::find(session, identifier);
  if (!found) return asSystemError(found.error());
  if (*found) return **std::move(found);
  AppRow unknown;
  unknown.identifier = identifier;
  return unknown;
}

Status Installer::install(const platform::FileLocation& location, const plist::Dictionary& options,
                          std::string_view applicationType) {
  const Result<InstallRequest> request = readInstallOptions(options);
  if (!request) return request.error();
  return request->role == BundleRole::installed ? installPackage(location, *request, applicationType)
                                                : installPlaceholder(location, *request, applicationType);
}

Status Installer::installPackage(const platform::FileLocation& location, const InstallRequest& request,
                                 std::string_view applicationType) {
  Result<AppRow> before = known(request.identifier);
  if (!before) return before.error();
  const bool hasPlaceholder = before->placeholder.has_value();
  if (before->applicationType.empty()) before->applicationType = applicationType;
  const auto progress = running_.begin(std::move(before).value(),
                                       {TSInstallState::Active, TSInstallPhase::Installing, kProgressUnits, 0});
  Status installed = unpackAndRecord(location, request, applicationType, *progress);
  if (installed) {
    running_.end(request.identifier, TSInstallState::Finished);
  } else if (hasPlaceholder) {
    progress->setInstallState(TSInstallState::Failed);
  } else {
    running_.end(request.identifier, TSInstallState::Failed);
  }
  return installed;
}

Status Installer::unpackAndRecord(const platform::FileLocation& location, const InstallRequest& request,
                                  std::string_view applicationType, InstallProgress& progress) {
  Result<FileDescriptor> file = files_.root().open(location.path, O_RDONLY | O_NONBLOCK);
  if (!file) return file.error();
  Result<PackageReader> package = PackageReader::open(std::move(file).value());
  if (!package) return package.error();
  Result<PendingContainer> container = PendingContainer::make(files_);
  if (!container) return container.error();
  const auto shouldContinue = [&progress](double fraction) {
    progress.setCompletedUnitCount(static_cast<std::int64_t>(fraction * static_cast<double>(kProgressUnits)));
    return progress.installState() != TSInstallState::Canceled;
  };
  const Result<UnpackedPackage> unpacked = unpackPackage(*package, container->folder(), shouldContinue);
  if (!unpacked) return unpacked.error();
  RETURN_IF_ERROR(checkIdentifier(unpacked->info, request));
  RETURN_IF_ERROR(keepStoreMetadata(*container, request));
  RETURN_IF_ERROR(app_data::commitRestoreData(files_, database_, request.identifier));
  RETURN_IF_ERROR(container->commit(Durability::power));
  return record(*container, request, applicationType, describe(unpacked->info, unpacked->appFolder, unpacked->bytes));
}

Status Installer::installPlaceholder(const platform::FileLocation& location, const InstallRequest& request,
                                     std::string_view applicationType) {
  const Result<RootDirectory::Place> source = files_.root().place(location.path);
  if (!source) return source.error();
  const std::string& folder = source->name;
  if (!isAppFolder(folder)) {
    return installerError(InstallerFailure::notAPackage,
                          "a placeholder is a folder \"Name.app\", and \"" + folder + "\" is not");
  }
  Result<PendingContainer> container = PendingContainer::make(files_);
  if (!container) return container.error();
  std::uint64_t bytes = 0;
  const int error = tree::copy(source->folder.get(), folder.c_str(), container->folder(), folder.c_str(), bytes);
  if (error != 0) return Error::fromErrno(error, location.path);
  const Result<BundleInfo> info = readInfoOf(container->folder(), folder);
  if (!info) return info.error();
  RETURN_IF_ERROR(checkIdentifier(*info, request));
  RETURN_IF_ERROR(keepStoreMetadata(*container, request));
  // Recovery removes a sync's placeholder, so it need not survive a power failure.
  const bool lasts = request.installType != TSInstallType::Sync;
  RETURN_IF_ERROR(container->commit(lasts ? Durability::power : Durability::process));
  return recordPlaceholder(*container, request, applicationType, describe(*info, folder, bytes));
}

Status Installer::recordPlaceholder(PendingContainer& container, const InstallRequest& request,
                                    std::string_view applicationType, StoredBundle bundle) {
  RETURN_IF_ERROR(record(container, request, applicationType, std::move(bundle)));
  if (request.installType && isDemotion(*request.installType)) {
    running_.end(request.identifier, TSInstallState::Finished);
  } else {
    Result<AppRow> app = known(request.identifier);
    if (!app) return app.error();
    running_.begin(std::move(app).value(), {});
  }
  return {};
}

Status Installer::record(PendingContainer& container, const InstallRequest& request, std::string_view applicationType,
                         StoredBundle bundle) {
  const Result<AppRow> app = known(request.identifier);
  if (!app) return app.error();
  AppRow before;
  {
    Database::Transaction transaction(database_, durabilityFor(request.role, *app));
    Result<std::optional<AppRow>> found = app_table::find(transaction, request.identifier);
    if (!found) return asSystemError(found.error());
    if (*found) before = **std::move(found);
    const auto& earlier = before.placeholder ? before.placeholder : before.installed;
    bundle.container = container.name();
    bundle.installType = request.installType ? *request.installType
                         : earlier           ? earlier->installType
                                             : bundle.installType;
    app_table::put(transaction, request.identifier, applicationType, request.role, bundle, request.licenceData)
        .ignore();
    if (request.role == BundleRole::installed) {
      app_table::remove(transaction, before, BundleRole::placeholder).ignore();
      UninstalledApps::remove(transaction, request.identifier).ignore();
      app_data::deleteRestoreRecord(transaction, request.identifier).ignore();
    }
    if (request.transactionHook) request.transactionHook(transaction);
    RETURN_IF_ERROR(asSystemError(transaction.commit()));
  }
  container.release();
  for (const StoredBundle* replaced : replacedBy(request.role, before))
    removeContainer(files_, replaced->container);
  return {};
}

Status Installer::uninstall(std::string_view bundleIdentifier, const plist::Dictionary& options,
                            const TransactionHook& transactionHook) {
  const Result<AppRow> before = known(bundleIdentifier);
  if (!before) return before.error();
  AppRow app;
  BundleRole role = requestedRole(options);
  {
    Database::Transaction transaction(database_, durabilityFor(role, *before));
    Result<std::optional<AppRow>> found = app_table::find(transaction, bundleIdentifier);
    if (!found) return asSystemError(found.error());
    if (!*found) {
      return installerError(InstallerFailure::unknownApp,
                            "there is no app \"" + std::string(bundleIdentifier) + "\" to remove");
    }
    app = **std::move(found);
    role = removedRole(role, app);
    if (role == BundleRole::installed && app.installed) {
      app_table::remove(transaction, app, BundleRole::installed).ignore();
      UninstalledApps::add(transaction, bundleIdentifier).ignore();
    }
    app_table::remove(transaction, app, BundleRole::placeholder).ignore();
    if (role == BundleRole::installed) app_data::markRemoved(transaction, bundleIdentifier).ignore();
    if (transactionHook) transactionHook(transaction);
    RETURN_IF_ERROR(asSystemError(transaction.commit()));
  }
  if (role == BundleRole::installed) app_data::sweepRemoved(files_, database_, bundleIdentifier);
  if (app.placeholder || role == BundleRole::installed) running_.end(bundleIdentifier, TSInstallState::Canceled);
  for (const StoredBundle* removed : replacedBy(role, app))
    removeContainer(files_, removed->container);
  return {};
}

}  // namespace appsync::device
