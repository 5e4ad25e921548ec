#include "device/apps/Demotion.h"

#include <memory>
#include <optional>
#include <string>
#include <utility>

#include <fcntl.h>

#include "base/ReturnIfError.h"
#include "device/apps/PlaceholderBundle.h"
#include "device/packages/BundleInfo.h"
#include "device/packages/InstallerError.h"
#include "device/packages/PackageReader.h"
#include "device/storage/Database.h"
#include "device/storage/FileTree.h"
#include "platform/SyncFiles.h"

namespace appsync::device {

using platform::TSInstallState;
using platform::TSInstallType;

namespace {

std::string containerOf(const StoredBundle& bundle) {
  return std::string(kContainersPath) + '/' + bundle.container;
}

std::optional<Bytes> readIfThere(DeviceFileSystem& files, const std::string& path) {
  Result<FileDescriptor> file = files.root().open(path, O_RDONLY | O_NONBLOCK);
  Bytes bytes;
  if (!file || tree::read(file->get(), kMaximumMetadataBytes, bytes) != 0) return std::nullopt;
  return bytes;
}

/// Returns the content of the placeholder that replaces a demoted app.
PlaceholderContents demotedPlaceholder(DeviceFileSystem& files, const AppRow& app, TSInstallType type) {
  const StoredBundle& bundle = *app.installed;
  const std::string appPath = containerOf(bundle) + '/' + bundle.folder;
  PlaceholderContents remains;
  remains.identifier = app.identifier;
  remains.bundleName = bundle.name;
  remains.installType = type;
  if (const auto document = readIfThere(files, appPath + '/' + std::string(kInfoPlistName))) {
    if (Result<BundleInfo> info = readBundleInfo(*document)) {
      const plist::Value* prohibited = info->dictionary.find(kLaunchProhibitedKey);
      remains.iconPath = namedFileIn(appPath, info->dictionary.find(platform::kBundleIconFileKey));
      remains.attributes = platform::PlaceholderAttributes::initWithInfoPlistDictionary(std::move(info->dictionary));
      remains.attributes.setLaunchProhibited(prohibited != nullptr && plist::truth(*prohibited).value_or(false));
    }
  }
  remains.attributes.setBundleVersion(bundle.version);
  remains.storeMetadata = readIfThere(files, containerOf(bundle) + '/' + std::string(kStoreMetadataName));
  return remains;
}

Error unknownApp(std::string_view identifier, std::string_view what) {
  return installerError(InstallerFailure::unknownApp,
                        "there is no app \"" + std::string(identifier) + "\" to " + std::string(what));
}

}  // namespace

Status Installer::demote(std::string_view bundleIdentifier, TSInstallType type) {
  const Result<AppRow> found = known(bundleIdentifier);
  if (!found) return found.error();
  const AppRow& app = *found;
  if (!app.installed) return unknownApp(bundleIdentifier, "demote");
  if (app.placeholder || running_.find(bundleIdentifier) != nullptr) {
    return installerError(InstallerFailure::badOptions,
                          "\"" + app.identifier + "\" is being updated; wait until the update has ended and try again");
  }
  Result<PlaceholderContainer> remains = makePlaceholder(files_, demotedPlaceholder(files_, app, type));
  if (!remains) return remains.error();
  PendingContainer& container = remains->container;
  if (const auto artwork = readIfThere(files_, containerOf(*app.installed) + '/' + std::string(kArtworkName))) {
    RETURN_IF_ERROR(container.writeFile(kArtworkName, *artwork));
  }
  RETURN_IF_ERROR(container.commit(Durability::power));
  remains->bundle.container = container.name();
  {
    Database::Transaction transaction(database_, Durability::power);
    app_table::put(transaction, app.identifier, app.applicationType, BundleRole::placeholder, remains->bundle, {})
        .ignore();
    app_table::remove(transaction, app, BundleRole::installed).ignore();
    RETURN_IF_ERROR(asSystemError(transaction.commit()));
  }
  container.release();
  removeContainer(files_, app.installed->container);
  return {};
}

Status Installer::setPlaceholderType(std::string_view bundleIdentifier, TSInstallType type) {
  const Result<AppRow> found = known(bundleIdentifier);
  if (!found) return found.error();
  const AppRow& app = *found;
  if (!app.placeholder || app.installed) return unknownApp(bundleIdentifier, "change the placeholder of");
  {
    Database::Session session(database_);
    RETURN_IF_ERROR(asSystemError(session.run("update bundles set install_type = ? where app = ? and role = ?", type,
                                              app.position, BundleRole::placeholder)));
  }
  if (isDemotion(type)) {
    running_.end(bundleIdentifier, TSInstallState::Finished);
  } else if (running_.find(bundleIdentifier) == nullptr) {
    AppRow changed = app;
    changed.placeholder->installType = type;
    running_.begin(std::move(changed), {});
  }
  return {};
}

Status Installer::renamePlaceholder(std::string_view bundleIdentifier, std::string_view name) {
  const Result<AppRow> found = known(bundleIdentifier);
  if (!found) return found.error();
  const AppRow& app = *found;
  if (!app.placeholder || app.installed) return unknownApp(bundleIdentifier, "rename the placeholder of");
  if (app.placeholder->name == name) return {};
  const std::string path =
      containerOf(*app.placeholder) + '/' + app.placeholder->folder + '/' + std::string(kInfoPlistName);
  Result<Bytes> document = files_.readFile(path);
  if (!document) return document.error();
  Result<BundleInfo> info = readBundleInfo(*document);
  if (!info) return info.error();
  info->dictionary.set(platform::kBundleDisplayNameKey, name);
  document = plist::writeBinary(info->dictionary);  // XML cannot represent every name.
  if (!document) return document.error();
  RETURN_IF_ERROR(files_.writeFileAtomically(path, *document));
  Database::Session session(database_);
  return asSystemError(session.run("update bundles set name = ? where app = ? and role = ?", name, app.position,
                                   BundleRole::placeholder));
}

bool Installer::isDemoted(std::string_view bundleIdentifier) {
  const Result<AppRow> app = known(bundleIdentifier);
  return app && app->placeholder && !app->installed && isDemotion(app->placeholder->installType);
}

Status Installer::beginReturn(std::string_view bundleIdentifier, const TransactionHook& transactionHook) {
  AppRow app;
  {
    Database::Transaction transaction(database_);
    Result<std::optional<AppRow>> found = app_table::find(transaction, bundleIdentifier);
    if (!found) return asSystemError(found.error());
    if (!*found || !(*found)->placeholder) return unknownApp(bundleIdentifier, "bring back");
    app = **std::move(found);
    transactionHook(transaction);
    RETURN_IF_ERROR(asSystemError(transaction.commit()));
  }
  running_.begin(std::move(app), {});
  return {};
}

Result<plist::Dictionary> demotedApps(AppRegistry& registry) {
  const auto apps = registry.apps();
  if (!apps) return apps.error();
  plist::Array automatic;
  plist::Array intentional;
  for (const auto& app : *apps) {
    if (!app->isPlaceholder() || app->isInstalled() || !isDemotion(app->installType())) continue;
    (app->installType() == TSInstallType::Downgrade ? automatic : intentional).push_back(app->applicationIdentifier());
  }
  return plist::Dictionary{{demoted_apps::kAutomaticKey, automatic}, {demoted_apps::kIntentionalKey, intentional}};
}

Status recordDemotedApps(AppRegistry& registry, DeviceFileSystem& files) {
  const Result<plist::Dictionary> list = demotedApps(registry);
  if (!list) return list.error();
  const Result<Bytes> document = plist::writeBinary(*list);
  if (!document) return document.error();
  return files.writeFileAtomically(kDemotedAppsPath, *document);
}

Status demote(AppRegistry& registry, DeviceFileSystem& files, std::string_view bundleIdentifier, TSInstallType type) {
  RETURN_IF_ERROR(registry.demote(bundleIdentifier, type));
  return recordDemotedApps(registry, files);
}

}  // namespace appsync::device
