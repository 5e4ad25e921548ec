// Which packages the host must still send.
#include "common/RestoreState.h"
#include "coordination/InProgressAssetQuery.h"
#include "core/AppsClient.h"
#include "platform/SyncFiles.h"
#include "plist/Access.h"
#include "transfer/SkipRules.h"
#include "transfer/WantedEntry.h"

namespace appsync {

namespace {

using platform::FileLocation;
using platform::ZTAsset;

WantedEntries entriesOfPlaceholders(AppsClient& client) {
  WantedEntries entries;
  client._enumeratePlaceholdersWithBlock([&entries](const platform::AppRecord& record, bool&) {
    entries.insert_or_assign(record.applicationIdentifier(), WantedEntry::fromPlaceholder(record));
  });
  return entries;
}

/// Adds the host's install requests to `wanted`; returns their identifiers.
IdentifierSet addTodoEntries(const plist::Array& todoList, WantedEntries& wanted, const PlugInLog& log) {
  IdentifierSet requested;
  for (const plist::Value& entry : todoList) {
    if (!entryHas(entry, todo::kOperation, todo::kInstall)) continue;
    const plist::Value* value = entry.find(todo::kIdentifier);
    if (!isValidBundleIdentifier(value)) {
      log.message("%s|Ignoring invalid path: %{public}@", value);
      continue;
    }
    const std::string identifier(*value->string());
    if (wanted.contains(identifier)) {
      log.message("%s|%{public}@ already has a placeholder - skipping", identifier);
    } else {
      wanted.emplace(identifier, WantedEntry::fromTodoEntry(entry, identifier));
    }
    requested.insert(identifier);
  }
  return requested;
}

void removeThoseInProgress(platform::Platform& platform, WantedEntries& wanted, const PlugInLog& log) {
  std::optional<InProgressAssetQuery::IdentifierList> inProgress;
  std::optional<InProgressAssetQuery::IdentifierList> restoring;
  InProgressAssetQuery::currentInProgressAssetIDs(platform, inProgress, restoring);
  if (inProgress) {
    log.message("%s|Assets already in progress (not returning these): %{public}@", *inProgress);
    for (const std::string& identifier : *inProgress)
      wanted.erase(identifier);
  } else {
    log.error("%s|Failed to get list of assets already in progress!");
  }
  // Apps being restored stay: the host may still have to send their packages.
  if (restoring) {
    log.message("%s|Assets currently restoring: %{public}@", *restoring);
  } else {
    log.error("%s|Failed to get list of assets currently restoring!");
  }
}

void emptyIconScratchFolder(platform::FileSystem& files, const PlugInLog& log) {
  files.removeItem(kIconScratchFolder).ignore();
  const Status created = files.createDirectory(kIconScratchFolder, platform::IntermediateDirectories::require, {});
  if (!created) log.error("%s|Can't create icon scratch dir! %{public}@", created.error());
}

std::optional<std::string> displayNameOfBundle(platform::Bundles& bundles, const std::optional<std::string>& path) {
  const auto location = path ? FileLocation::directory(*path) : std::nullopt;
  const auto bundle = location ? bundles.openBundle(*location) : nullptr;
  return bundle ? ownedStringIn(bundle->infoDictionaryValue(platform::kBundleDisplayNameKey)) : std::nullopt;
}

std::optional<std::string> inFolder(const std::optional<std::string>& folder, std::string_view name) {
  return folder ? std::optional(*folder + "/" + std::string(name)) : std::nullopt;
}

/// Returns the app's rendered icon or, if it cannot be rendered, the artwork from its container.
std::optional<FileLocation> iconFor(platform::Platform& platform, const WantedEntry& entry) {
  const std::string rendered = std::string(kIconScratchFolder) + "/" + entry.identifier() + ".png";
  if (AppsClient::_makeIconFromBundlePath(platform, entry.path(), rendered)) return FileLocation::file(rendered);
  const auto artwork = inFolder(entry.container(), kArtworkName);
  return artwork ? FileLocation::file(*artwork) : std::nullopt;
}

/// Whether the package of a restored app is on the device already, so that the host sends only its data.
bool packageIsOnDevice(platform::FileSystem& files, const WantedEntry& entry, const RestoreState& restoreState,
                       const PlugInLog& log) {
  const auto path = stringIn(restoreState.property(kRestoreStatePathKey, entry.identifier(), entry.version()));
  if (!path) return false;
  const bool exists = files.fileExists(*path);
  if (exists) {
    log.message("%s|Recovered download path for %{public}@ at %{public}@", entry.identifier(), *path);
  } else {
    log.message("%s|Download path recovered for %{public}@ but the file is missing: %{public}@", entry.identifier(),
                *path);
  }
  return exists;
}

std::uint32_t partsToSend(bool isRestore, bool packageIsHere) {
  if (!isRestore) return platform::kZTAssetPartApplication;
  return packageIsHere ? platform::kZTAssetPartApplicationData : platform::kZTAssetPartsAll;
}

std::shared_ptr<ZTAsset> makeAsset(platform::Platform& platform, const WantedEntry& entry,
                                   const std::optional<std::string>& displayName, const RestoreState& restoreState,
                                   const PlugInLog& log) {
  const std::string identifier = entry.identifier();
  const std::string prettyName = displayName ? *displayName : entry.nameFromHost().value_or(identifier);
  const auto icon = iconFor(platform, entry);
  auto asset = platform.syncFramework().downloadAssetWithIdentifier(identifier, kApplicationDataclass, prettyName);
  asset->setIcon(icon);
  asset->setIsRestore(entry.isRestore());

  const bool packageIsHere = packageIsOnDevice(platform.fileSystem(), entry, restoreState, log);
  plist::Dictionary options{{platform::kAssetPartsKey, partsToSend(entry.isRestore(), packageIsHere)}};
  const plist::Value* version = entry.version();
  if (version != nullptr) options.set(platform::kAssetVersionKey, *version);
  asset->setVariantOptions(std::move(options));

  asset->setStorePlist(inFolder(entry.container(), kStoreMetadataName));
  asset->setInfoPlist(inFolder(entry.container(), kInfoPlistName));
  log.message(
      "%s|Asset %{public}@ (pretty=%{public}@, version=%{public}@) prepped with icon %{public}@, at %{public}@, meta at %{public}@, info at %{public}@, storePid=%lld, isRestore=%c",
      identifier, prettyName, version, icon, entry.path(), asset->storePlist(), asset->infoPlist(), asset->storePID(),
      asset->isRestore());
  return asset;
}

/// Returns whether the host must send the package.
bool preparePlaceholder(AppsClient& client, const ZTAsset& asset, bool hasPlaceholder, const PlugInLog& log) {
  if (hasPlaceholder) {
    log.message("%s|Not creating a placeholder app for %{public}@ because we already have one", asset.identifier());
    // Only a restore's placeholder waits for the host; another client provides the package of any other.
    return asset.isRestore();
  }
  client._createPlaceHolderApplication(asset);
  return true;
}

}  // namespace

platform::Assets AppsClient::outstandingAssetTransfers() {
  platform::Assets outstanding;
  outstanding.reserve(16);
  const bool installationIsAllowed = _appInstallationAllowed();
  const auto todoList = _loadPlist(_platform, kTodoListPath, nullptr);
  _log.summary("%s|outstandingAssetTransfers starting with todoList %{public}@", todoList);

  const IdentifierSet systemAppPlaceholders = _getSystemAppPlaceholders();
  const WantedEntries preExisting = entriesOfPlaceholders(*this);
  WantedEntries wanted = preExisting;
  _log.summary("%s|outstandingAssetTransfers preExistingPlaceHolders %{public}@, idsWeWant %{public}@",
               DescribedEntries{preExisting}, DescribedEntries{wanted});
  const IdentifierSet requested = todoList ? addTodoEntries(*todoList, wanted, _log) : IdentifierSet{};
  removeThoseInProgress(_platform, wanted, _log);
  const auto ordered = _orderTheItems(_platform, wanted);
  emptyIconScratchFolder(_platform.fileSystem(), _log);
  const RestoreState restoreState = _accessQueue.sync([this] { return RestoreState(_platform.fileSystem()); });

  for (const WantedEntry& entry : ordered) {
    const std::string identifier = entry.identifier();
    const auto displayName = displayNameOfBundle(_platform.bundles(), entry.path());
    const TransferCandidate candidate{
        .identifier = identifier,
        .isRestore = entry.isRestore(),
        .isAutomaticallyDemoted = entry.isAutomaticallyDemoted(),
        .isIntentionallyDemoted = entry.isIntentionallyDemoted(),
        .isSystemApp = entry.isSystemApp(),
        .installationIsAllowed = installationIsAllowed,
        .usesInstallCoordinator = _useInstallCoordinator,
        .isToBeIgnored = _klpAppsToIgnore.contains(identifier),
        .isSystemAppPlaceholder = systemAppPlaceholders.contains(identifier),
        .isRequestedByHost = requested.contains(identifier),
    };
    if (isSkipped(candidate, _log)) continue;
    auto asset = makeAsset(_platform, entry, displayName, restoreState, _log);
    const bool isPrepared = _useInstallCoordinator
                                ? _prepareCoordinatedInstall(*asset)
                                : preparePlaceholder(*this, *asset, preExisting.contains(identifier), _log);
    if (isPrepared) outstanding.push_back(std::move(asset));
  }
  return outstanding;
}

bool AppsClient::_prepareCoordinatedInstall(const ZTAsset& asset) {
  const std::string& identifier = asset.identifier();
  const auto record = _platform.defaultRegistry().recordForIdentifier(identifier, platform::PlaceholderLookup::off);
  const bool isUpdate = record && record->isInstalled() && !record->isPlaceholder();
  if (isUpdate) _log.message("%s|App %{public}@ is already installed and will be updated.", identifier);
  if (!prepareAppForInstallUsingCoordination(asset, isUpdate)) {
    _log.error("%s|Not requesting app asset for %{public}@", identifier);
    _accessQueue.sync([&] { changeAssetID(identifier, todo::kFailed); });
    return false;
  }
  if (isUpdate) _accessQueue.sync([&] { _updatingApps.insert(identifier); });
  return true;
}

}  // namespace appsync
