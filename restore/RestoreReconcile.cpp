// What the host left on the device after a restore: each app in it gets a placeholder.
#include <chrono>
#include <utility>

#include "core/AppsClient.h"
#include "platform/SyncFiles.h"
#include "plist/Access.h"
#include "plist/DictionaryStream.h"
#include "restore/DemotedApps.h"

namespace appsync {

namespace {

constexpr std::string_view kRestoreInfoPath = "/var/mobile/Media/HarvoRestore/RestoreApplications.plist";
/// Where it ends, for whoever has to find out what was restored.
constexpr std::string_view kFiledRestoreInfoPath = "/var/mobile/Library/Logs/MediaServices/RestoreApplications.plist";

/// A host's file may hold thousands of apps with their icons: only one is in memory beside it at a time.
std::optional<plist::DictionaryStream> readRestoreInfo(platform::FileSystem& files, const PlugInLog& log) {
  auto bytes = files.readFile(kRestoreInfoPath);
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
  const Status moved = files.moveItem(kRestoreInfoPath, kFiledRestoreInfoPath);
  if (!moved) log.message("%s|failed to copy harvo metadata. err=%{public}@", moved.error());
}

/// The app's store metadata, if there is something to be done for it.
std::optional<ByteView> usableMetadata(const plist::Value& entry, std::string_view identifier, const PlugInLog& log) {
  if (entry.dictionary() == nullptr) {
    log.message("%s|no harvo restore info for '%{public}@' - skipping", identifier);
    return std::nullopt;
  }
  const auto metadata = dataIn(entry.find("HarvoMetadata"));
  if (!metadata) log.message("%s|no HarvoMetadata for '%{public}@' - ignoring", identifier);
  return metadata;
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
  if (!files.fileExists(kRestoreInfoPath)) {
    _log.message("%s|no harvo restore plist found - skipping processing of harvo restored apps");
    return true;
  }
  bool result = false;
  if (auto info = readRestoreInfo(files, _log)) {
    result = _restoreApps(*info);
    info.reset();
    _waitForRestorePlaceholders();
  }
  fileRestoreInfoAway(files, _log);
  return result;
}

/// What came of the last app that there was something to do for.
bool AppsClient::_restoreApps(plist::DictionaryStream& info) {
  const DemotedApps demotedApps(_loadDemotedAppsPlist(_platform, kDemotedAppsPath, nullptr));
  _log.summary("%s|Demoted Apps: %{public}@", demotedApps.lists());
  // Asked for each app, a walk would cost as many walks as there are apps. What comes to the device while a restore
  // runs is not seen.
  const Identifiers userBundles = _useInstallCoordinator ? Identifiers{} : _userBundles();
  bool result = false;
  info.visit([&](std::string_view identifier, const plist::Value& entry) {
    if (!isValidBundleIdentifier(identifier)) {
      _log.message("%s|Ignoring invalid path: %{public}@", identifier);
      return;
    }
    const DemotionStatus status = demotedApps.statusOf(identifier);
    _log.message("%s|processing harvo restore info for '%{public}@' demotionStatus :%lu", identifier,
                 static_cast<std::uint64_t>(status));
    if (_placeholderExistsForApplication(identifier, &userBundles)) {
      _log.message("%s|placeholder already exists for '%{public}@' - skiping'", identifier);
      return;
    }
    const auto metadata = usableMetadata(entry, identifier, _log);
    if (!metadata) return;
    const auto sinf = dataIn(entry.find("ApplicationSINF"));
    const auto icon = dataIn(entry.find("PlaceholderIcon"));
    result = _useInstallCoordinator ? prepareAppForRestoreUsingCoordination(identifier, *metadata, sinf, icon, status)
                                    : _processHarvoRestoreInfoForApp(identifier, *metadata, sinf, icon);
  });
  return result;
}

/// Bounded: a placeholder that never comes does not hold the daemon up for ever.
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
