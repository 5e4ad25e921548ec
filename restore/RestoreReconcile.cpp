// The host's restore file: each app in it gets a placeholder.
#include <chrono>
#include <utility>

#include "core/AppsClient.h"
#include "platform/SyncFiles.h"
#include "plist/Access.h"
#include "plist/DictionaryStream.h"
#include "restore/DemotedApps.h"
#include "restore/PlaceholderEnumeration.h"

namespace appsync {

namespace {

/// The restore file is moved here, for debugging.
constexpr std::string_view kFiledRestoreInfoPath = "/var/mobile/Library/Logs/MediaServices/RestoreApplications.plist";

/// The file may contain thousands of apps with their icons: it is read as a stream, one app at a time.
std::optional<plist::DictionaryStream> readRestoreInfo(platform::FileSystem& files, const PlugInLog& log) {
  auto bytes = files.readFile(kRestoreApplicationsPath);
  if (!bytes) {
    log.message("%s|failed to read harvo app restore info. err=%{public}@", bytes.error());
    return std::nullopt;
  }
  log.message("%s|processing harvo restore info");
  auto info = plist::DictionaryStream::open(std::move(bytes).value());
  if (!info) {
    log.message("%s|failed to parse harvo app restore info. err=%{public}@", info.error());
    return std::nullopt;
  }
  return std::move(info).value();
}

void fileRestoreInfoAway(platform::FileSystem& files, const PlugInLog& log) {
  files.removeItem(kFiledRestoreInfoPath).ignore();
  const Status moved = files.moveItem(kRestoreApplicationsPath, kFiledRestoreInfoPath);
  if (!moved) log.message("%s|failed to copy harvo metadata. err=%{public}@", moved.error());
}

/// Returns the app's store metadata, or nullopt if the app needs no placeholder.
std::optional<ByteView> usableMetadata(const plist::Value& entry, std::string_view identifier, const PlugInLog& log) {
  if (entry.dictionary() == nullptr) {
    log.message("%s|no harvo restore info for '%{public}@' - skipping", identifier);
    return std::nullopt;
  }
  const auto metadata = dataIn(entry.find(restore_file::kMetadataKey));
  if (!metadata) log.message("%s|no HarvoMetadata for '%{public}@' - ignoring", identifier);
  return metadata;
}

/// Returns the result for the last app that needed a placeholder, or false if none did.
bool restoreApps(AppsClient& client, platform::Platform& platform, plist::DictionaryStream& info,
                 bool useInstallCoordinator, const PlugInLog& log) {
  const DemotedApps demotedApps(AppsClient::_loadDemotedAppsPlist(platform, kDemotedAppsPath, nullptr));
  log.summary("%s|Demoted Apps: %{public}@", demotedApps.lists());
  // Enumerate once instead of once per app. Apps installed during the restore are not seen.
  const IdentifierSet existing = useInstallCoordinator ? IdentifierSet{} : userBundles(platform.defaultRegistry());
  bool result = false;
  info.visit([&](std::string_view identifier, const plist::Value& entry) {
    if (!isValidBundleIdentifier(identifier)) {
      log.message("%s|Ignoring invalid path: %{public}@", identifier);
      return;
    }
    const DemotionStatus status = demotedApps.statusOf(identifier);
    log.message("%s|processing harvo restore info for '%{public}@' demotionStatus :%lu", identifier,
                static_cast<std::uint64_t>(status));
    if (existing.contains(identifier)) {
      log.message(kFoundPlaceholder, identifier);
      log.message("%s|placeholder already exists for '%{public}@' - skiping'", identifier);
      return;
    }
    const auto metadata = usableMetadata(entry, identifier, log);
    if (!metadata) return;
    const auto sinf = dataIn(entry.find(restore_file::kLicenceKey));
    const auto icon = dataIn(entry.find(restore_file::kIconKey));
    result = useInstallCoordinator
                 ? client.prepareAppForRestoreUsingCoordination(identifier, *metadata, sinf, icon, status)
                 : client._processHarvoRestoreInfoForApp(identifier, *metadata, sinf, icon);
  });
  return result;
}

}  // namespace

bool AppsClient::reconcileRestoreOfType(std::int32_t restoreType, ErrorSlot error) {
  _log.message("%s|reconcileRestoreOfType %d", restoreType);
  _notifySolvary(_platform, true);
  _platform.fileSystem().createDirectory(kSyncFolder, platform::IntermediateDirectories::create, {}).ignore();
  if (restoreType == platform::kRestoreTypeHost) _processHarvoRestoreInfo();
  if (error != nullptr) error->reset();
  return true;
}

bool AppsClient::_processHarvoRestoreInfo() {
  platform::FileSystem& files = _platform.fileSystem();
  if (!files.fileExists(kRestoreApplicationsPath)) {
    _log.message("%s|no harvo restore plist found - skipping processing of harvo restored apps");
    return true;
  }
  bool result = false;
  if (auto info = readRestoreInfo(files, _log)) {
    result = restoreApps(*this, _platform, *info, _useInstallCoordinator, _log);
    info.reset();
    _waitForRestorePlaceholders();
  }
  fileRestoreInfoAway(files, _log);
  return result;
}

/// Bounded: a placeholder that is never installed must not block the daemon.
void AppsClient::_waitForRestorePlaceholders() {
  constexpr std::int64_t kSecondsEach = 5;
  const std::int64_t awaited = _restoringPlaceholderCount;
  const TimePoint deadline = deadlineAfter(_platform.clock().now(), std::chrono::seconds(awaited * kSecondsEach));
  _log.message("%s|Will wait for %lld seconds for %lld placeholders to install", awaited * kSecondsEach, awaited);
  _restorePlaceHoldersWaitGroup.wait(deadline);
  _restoreQueue.sync([this] {
    _log.message("%s|Finished waiting for placeholder installs");
    _finishedWaitingForPlaceHolderInstalls = true;
  });
}

}  // namespace appsync
