#include "host/Backup.h"

#include <cerrno>
#include <set>

#include "device/packages/BundleIdentifier.h"
#include "device/storage/HostFile.h"
#include "plist/Access.h"

namespace appsync::host {
namespace {

using platform::TSInstallType;

constexpr std::string_view kFormatKey = "Format";
constexpr std::string_view kFormat = "appsync backup";
constexpr std::string_view kVersionKey = "Version";
constexpr std::uint64_t kVersion = 1;
constexpr std::string_view kIdentifierKey = "Identifier";
constexpr std::string_view kAppsKey = "Apps";
constexpr std::string_view kIconOrderKey = "IconOrder";
constexpr std::string_view kNameKey = "Name";
constexpr std::string_view kAppVersionKey = "AppVersion";
constexpr std::string_view kDemotionKey = "InstallType";

std::string textIn(const plist::Value& entry, std::string_view key) {
  return ownedStringIn(entry.find(key)).value_or("");
}

std::optional<std::uint64_t> numberIn(const plist::Value& entry, std::string_view key) {
  const plist::Value* value = entry.find(key);
  return value == nullptr ? std::nullopt : value->uint64();
}

void setNumber(plist::Dictionary& entry, std::string_view key, const std::optional<std::uint64_t>& number) {
  if (number) entry.set(key, *number);
}

plist::Value entryOf(const BackedUpApp& app) {
  plist::Dictionary entry = {{kIdentifierKey, app.name.identifier}, {kNameKey, app.name.name}};
  if (!app.name.version.empty()) entry.set(kAppVersionKey, app.name.version);
  if (app.isDemoted()) entry.set(kDemotionKey, static_cast<std::uint64_t>(app.demotion));
  setNumber(entry, backup_files::kStoreMetadata, app.storeMetadata);
  setNumber(entry, backup_files::kLicence, app.licence);
  setNumber(entry, backup_files::kIcon, app.icon);
  setNumber(entry, backup_files::kData, app.data);
  return entry;
}

BackedUpApp appIn(const plist::Value& entry) {
  BackedUpApp app;
  app.name = {textIn(entry, kIdentifierKey), textIn(entry, kNameKey), textIn(entry, kAppVersionKey)};
  app.storeMetadata = numberIn(entry, backup_files::kStoreMetadata);
  app.licence = numberIn(entry, backup_files::kLicence);
  app.icon = numberIn(entry, backup_files::kIcon);
  app.data = numberIn(entry, backup_files::kData);
  const auto type = static_cast<TSInstallType>(numberIn(entry, kDemotionKey).value_or(0));
  if (type == TSInstallType::Downgrade || type == TSInstallType::IntentionalDowngrade) app.demotion = type;
  if (!device::isBundleIdentifier(app.name.identifier)) {
    app.damage = "its name in the backup is not a bundle identifier";
  }
  return app;
}

Error notABackup(const std::string& path, const std::string& why) {
  return {std::string(domains::kPOSIX), EINVAL,
          path + " is not a usable backup: " + why + "; name a folder that `appsync backup` created", nullptr};
}

}  // namespace

plist::Dictionary manifestOf(const Backup& backup) {
  plist::Array apps;
  for (const BackedUpApp& app : backup.apps)
    apps.push_back(entryOf(app));
  return {{kFormatKey, kFormat},
          {kVersionKey, kVersion},
          {kIdentifierKey, backup.identifier},
          {kAppsKey, std::move(apps)},
          {kIconOrderKey, plist::Array(backup.iconOrder.begin(), backup.iconOrder.end())}};
}

Result<Backup> readBackup(const std::string& path) {
  const Result<Bytes> document = device::readHostFile(path + "/" + std::string(backup_files::kManifest));
  if (!document) return notABackup(path, document.error().text);
  const Result<plist::Value> root = plist::read(*document);
  if (!root) return notABackup(path, "its manifest is damaged (" + root.error().text + ")");
  if (textIn(*root, kFormatKey) != kFormat) return notABackup(path, "its manifest is not that of a backup");
  const auto version = numberIn(*root, kVersionKey);
  if (version != kVersion) {
    return notABackup(path, "it has version " + (version ? std::to_string(*version) : std::string("(none)")) +
                                " and this program reads version " + std::to_string(kVersion));
  }
  Backup backup{path, textIn(*root, kIdentifierKey), {}, {}};
  const plist::Value* apps = root->find(kAppsKey);
  if (backup.identifier.empty() || apps == nullptr || apps->array() == nullptr) {
    return notABackup(path, "its manifest lacks the list of apps");
  }
  std::set<std::string> names;
  for (const plist::Value& entry : *apps->array()) {
    BackedUpApp app = appIn(entry);
    if (!names.insert(app.name.identifier).second) continue;
    backup.apps.push_back(std::move(app));
  }
  const plist::Value* order = root->find(kIconOrderKey);
  if (order == nullptr || order->array() == nullptr) return backup;
  for (const plist::Value& icon : *order->array()) {
    if (const auto identifier = icon.string()) backup.iconOrder.emplace_back(*identifier);
  }
  return backup;
}

Result<Bytes> readBackupFile(const Backup& backup, const BackedUpApp& app, std::string_view name, std::uint64_t size) {
  const std::string path =
      backup.path + "/" + std::string(backup_files::kApps) + "/" + app.name.identifier + "/" + std::string(name);
  Result<Bytes> bytes = device::readHostFile(path);
  if (!bytes || bytes->size() == size) return bytes;
  return Error{
      std::string(domains::kPOSIX), EINVAL,
      path + " is damaged: it has " + std::to_string(bytes->size()) + " bytes and must have " + std::to_string(size),
      nullptr};
}

std::string dataFolderIn(const Backup& backup, const BackedUpApp& app) {
  return backup.path + "/" + std::string(backup_files::kApps) + "/" + app.name.identifier + "/" +
         std::string(backup_files::kData);
}

}  // namespace appsync::host
