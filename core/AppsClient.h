// The plug-in: the sync daemon's client for the dataclass "Application".
#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include "base/Error.h"
#include "base/Group.h"
#include "base/OperationQueue.h"
#include "base/SerialQueue.h"
#include "common/Identifiers.h"
#include "common/PlugInLog.h"
#include "core/AppInstallUsingCoordination.h"
#include "platform/Platform.h"
#include "platform/ZTClient.h"
#include "plist/PropertyList.h"

namespace appsync::plist {
class DictionaryStream;
}

namespace appsync {

class WantedEntry;
struct PlaceholderInfo;

/// What was known of an app when its transfer ended.
struct TransferMarks {
  bool isExistingApp = false;
  bool isUserCancelled = false;
};

/// One object, made once by the daemon and kept for the life of the process. Installs, removes and prepares apps as the
/// host's todo list asks, and writes into that list how far each has come.
///
/// Threads: as `platform::ZTClient` says. Nothing is thrown; failures go to the log, and to error slots where the
/// daemon gives one. Queued installs, scheduled retries and a coordinator's callbacks that are under way own a share of
/// the object, so its destructor may run on any thread; callbacks of the services that it observes are waited for.
///
/// Class operations need no object and take the platform instead. Operations and fields that begin with an underscore
/// are the plug-in's own; of the operations those are public that tests and the other rooms' files use as they stand.
class AppsClient final : public platform::ZTClient,
                         public platform::AppRegistryObserver,
                         public platform::InstallObserverDelegate,
                         public AppInstallUsingCoordination,
                         public std::enable_shared_from_this<AppsClient> {
  struct Token {};  // Only create() makes one.

 public:
  // ---- core: lifecycle

  /// The object, registered with the platform's services, which must outlive it. Never null.
  [[nodiscard]] static std::shared_ptr<AppsClient> create(platform::Platform& platform);

  AppsClient(Token, platform::Platform& platform);
  ~AppsClient() override;
  AppsClient(const AppsClient&) = delete;
  AppsClient& operator=(const AppsClient&) = delete;

  /// For logs.
  [[nodiscard]] std::string description() const { return "<AppsClient>"; }

  // ---- core: what the daemon asks, in the order of a sync

  /// supportedDataclasses
  [[nodiscard]] std::vector<std::string> supportedDataclasses() override;
  /// currentSyncAnchor: a constant; the plug-in keeps no anchor.
  [[nodiscard]] std::string currentSyncAnchor() override;
  /// prepareForSyncWithHostAnchor:progressCallback:error: always succeeds.
  bool prepareForSyncWithHostAnchor(std::string_view hostAnchor, const platform::ProgressCallback& progressCallback,
                                    ErrorSlot error) override;
  /// installedAssets: { "_Deleted": apps that are gone since the host last knew them }.
  [[nodiscard]] plist::Dictionary installedAssets() override;
  /// reconcileSync:withNewAnchor:progressCallback:error: takes the staging folder over and removes apps. False only
  /// when the work area cannot be made or filled.
  bool reconcileSync(const platform::Assets& assets, std::string_view newAnchor,
                     const platform::ProgressCallback& progressCallback, ErrorSlot error) override;
  /// assetTransferEndedWithSuccess: blocks until every install of this sync is done.
  void assetTransferEndedWithSuccess(bool success) override;
  /// syncEndedWithSuccess:
  void syncEndedWithSuccess(bool success) override;
  /// clearSyncData: forgets everything about syncing and removes all placeholders.
  void clearSyncData() override;

  // ---- core: used by the other rooms

  /// _appInstallationAllowed, _appRemovalAllowed: true unless a restriction says no.
  [[nodiscard]] bool _appInstallationAllowed();
  [[nodiscard]] bool _appRemovalAllowed();
  /// _getAndResetNumAppInstallsAttempted
  [[nodiscard]] std::int32_t _getAndResetNumAppInstallsAttempted();

  /// _loadPlist:withError: (class operation) the array in that file; none, with a message unless the file is absent or
  /// empty, when there is no such thing.
  [[nodiscard]] static std::optional<plist::Array> _loadPlist(platform::Platform& platform, std::string_view path,
                                                              ErrorSlot error);
  /// _notifySolvary: (class operation) tells the home screen that a sync is starting, or done.
  static void _notifySolvary(platform::Platform& platform, bool starting);
  /// _orderTheItems: (class operation) the items in on-screen order of their icons, then the others. `items` keeps the
  /// others only.
  template <class Item>
  [[nodiscard]] static std::vector<Item> _orderTheItems(platform::Platform& platform,
                                                        std::map<std::string, Item, std::less<>>& items);

  // ---- transfer

  /// outstandingAssetTransfers: the packages that the host must still send, each with its placeholder made.
  [[nodiscard]] platform::Assets outstandingAssetTransfers() override;
  /// assetTransfer:updatedProgress:
  void assetTransferUpdatedProgress(const std::shared_ptr<platform::ZTAsset>& asset, double fraction) override;
  /// assetTransfer:succeeded:withError:
  void assetTransferSucceeded(const std::shared_ptr<platform::ZTAsset>& asset, bool succeeded,
                              const std::optional<Error>& error) override;
  /// _progressForAssetIdentifier: null when there is none.
  [[nodiscard]] std::shared_ptr<platform::InstallProgress> _progressForAssetIdentifier(std::string_view identifier);

  /// _enqueueAssetInstall: queues one install and returns.
  void _enqueueAssetInstall(const std::shared_ptr<platform::ZTAsset>& asset);
  /// _performAssetInstall: runs one install on the calling thread.
  void _performAssetInstall(const std::shared_ptr<platform::ZTAsset>& asset);
  /// assetInstallSucceeded:
  void assetInstallSucceeded(const platform::ZTAsset& asset);
  /// assetInstallFailed:withError:
  void assetInstallFailed(const platform::ZTAsset& asset, const Error& error);
  /// _isRecoverableError:
  [[nodiscard]] bool _isRecoverableError(const std::optional<Error>& error);

  /// placeholderAppPathForBundleIdentifier: where that app's placeholder bundle is built.
  [[nodiscard]] std::string placeholderAppPathForBundleIdentifier(std::string_view bundleIdentifier);
  /// createPlaceHolderPath:forBundleIdentifier:withAttributes:
  bool createPlaceHolderPath(std::string_view path, std::string_view bundleIdentifier,
                             const platform::OwnerAttributes& attributes);
  /// writeIconData:atPath:returningFileSize:forBundleIdentifier:withAttributes: `icon` may be absent; `fileSize` may be
  /// null and is set only when the size is known.
  bool writeIconData(const std::optional<ByteView>& icon, std::string_view path, std::uint64_t* fileSize,
                     std::string_view bundleIdentifier, const platform::OwnerAttributes& attributes);
  /// _makeIconFromBundlePath:saveTo: (class operation)
  static bool _makeIconFromBundlePath(platform::Platform& platform, const std::optional<std::string>& bundlePath,
                                      std::string_view destination);
  /// _createPlaceHolderApplication: builds and installs a placeholder; what goes wrong is only logged.
  void _createPlaceHolderApplication(const platform::ZTAsset& asset);

  // ---- coordination

  bool prepareAppForInstallUsingCoordination(const platform::ZTAsset& asset, bool existingApp) override;
  /// updateTransferProgressForApp:existingApp: false when no coordinator waits for the package.
  bool updateTransferProgressForApp(const platform::ZTAsset& asset, bool existingApp);
  /// transferCompleteForApp:withError:isExistingApp: the service installs the package, or hears why it never comes.
  void transferCompleteForApp(const platform::ZTAsset& asset, const std::optional<Error>& error, bool isExistingApp);
  /// assetSyncFinishedWithStatus:outstandingItems: after a failed sync nobody waits for these any more.
  void assetSyncFinishedWithStatus(bool success, const Identifiers& outstandingItems);
  void uninstallAppUsingCoordination(std::string_view bundleIdentifier) override;

  /// _initiatingOrUpdatingAppInstallCoordinatorForBundleIdentifier:existingApp:createIfNotExisting:error: null when
  /// there is none that the plug-in may drive; `error` is what the service said, also when it said nothing.
  [[nodiscard]] std::shared_ptr<platform::InstallCoordinator>
  _initiatingOrUpdatingAppInstallCoordinatorForBundleIdentifier(std::string_view bundleIdentifier, bool existingApp,
                                                                bool createIfNotExisting, ErrorSlot error);
  /// _placeHolderForBundleIdentifier:name:installType: the caller's; null when it cannot be made.
  [[nodiscard]] std::shared_ptr<platform::Placeholder> _placeHolderForBundleIdentifier(
      std::string_view bundleIdentifier, std::string_view name, platform::TSInstallType installType);
  /// _createAppAssetPromiseForBundleIdentifier:atPath:andAddToCoordinatinator: null when it cannot be made or attached.
  std::shared_ptr<platform::PromisedTransferToPath> _createAppAssetPromiseForBundleIdentifier(
      std::string_view bundleIdentifier, const std::optional<std::string>& path,
      const std::shared_ptr<platform::InstallCoordinator>& coordinator);
  /// _createIconPromiseForBundleIdentifier:transferPath:diskSpaceNeeded:andAddToPlaceHolder:forAppInstall: the same.
  std::shared_ptr<platform::PromisedTransferToPath> _createIconPromiseForBundleIdentifier(
      std::string_view bundleIdentifier, std::string_view transferPath, std::uint64_t diskSpaceNeeded,
      const std::shared_ptr<platform::Placeholder>& placeHolder, bool forAppInstall);
  /// _userDataPromiseForBundleIdentifier: kept already: there is no data to wait for. Attached to nothing.
  [[nodiscard]] std::shared_ptr<platform::PromisedOutOfBandTransfer> _userDataPromiseForBundleIdentifier(
      std::string_view bundleIdentifier);

  // ---- coordination: what the services report, on their threads

  /// setupInstallCoordinatorObserver: opens the observer connection unless it is open.
  void setupInstallCoordinatorObserver();
  void coordinatorDidInstallPlaceholder(platform::InstallCoordinator& coordinator) override;
  void coordinatorDidCompleteSuccessfully(platform::InstallCoordinator& coordinator) override;
  void coordinatorShouldPrioritize(platform::InstallCoordinator& coordinator) override;
  void coordinatorCanceledWithReason(platform::InstallCoordinator& coordinator, const Error& reason,
                                     platform::ClientIdentity client) override;
  void promiseDidBeginFulfillmentWithIdentifier(std::uint64_t identifier) override;
  /// applicationInstallsDidCancel: matters only where installs are not coordinated.
  void applicationInstallsDidCancel(const platform::AppRecords& records) override;

  // ---- restore: state and todo words

  // These read, change and rewrite whole files without a lock: who is not on a queue submits them to `_accessQueue`.

  /// _restoreStatePropertyForKey:identifier:version: none at a missing level, and for a version that is no string.
  [[nodiscard]] std::optional<plist::Value> _restoreStatePropertyForKey(std::string_view key,
                                                                        std::string_view identifier,
                                                                        const plist::Value* version);
  /// _setRestoreStatePropertyValue:forKey:identifier:version: does nothing for a version that is no string.
  void _setRestoreStatePropertyValue(const plist::Value& value, std::string_view key, std::string_view identifier,
                                     const plist::Value* version);
  /// cleanRestoreStateForIdentifier: every version of it.
  void cleanRestoreStateForIdentifier(std::string_view identifier);
  /// changeAssetID:toDo: the one writer of the todo list.
  void changeAssetID(std::string_view identifier, std::string_view toDo);
  /// _operationStateForIdentifier:
  [[nodiscard]] std::optional<plist::Value> _operationStateForIdentifier(std::string_view identifier);

  // ---- restore: placeholders

  using PlaceholderVisitor = std::function<void(const platform::AppRecord& record, bool& stop)>;

  /// _placeholderExistsForApplication:
  /// Walks the registry, unless who asks about many apps brings what a walk has found.
  [[nodiscard]] bool _placeholderExistsForApplication(std::string_view bundleIdentifier,
                                                      const Identifiers* userBundles = nullptr);
  /// _enumeratePlaceholdersWithBlock: on the calling thread, before it returns.
  void _enumeratePlaceholdersWithBlock(const PlaceholderVisitor& visit);
  /// _getSystemAppPlaceholders
  [[nodiscard]] Identifiers _getSystemAppPlaceholders();

  // ---- restore: what a host has left on a restored device

  /// reconcileRestoreOfType:withError: never fails. Blocks for at most five seconds per placeholder.
  bool reconcileRestoreOfType(std::int32_t restoreType, ErrorSlot error) override;
  /// _processHarvoRestoreInfo: what came of the last app that there was something to do for; true without a file.
  bool _processHarvoRestoreInfo();
  /// _processHarvoRestoreInfoForApp:harvoMetaData:sinfData:iconData: builds a placeholder and has it installed. True,
  /// too, for metadata that cannot be read.
  bool _processHarvoRestoreInfoForApp(std::string_view bundleIdentifier, ByteView harvoMetaData,
                                      const std::optional<ByteView>& sinfData, const std::optional<ByteView>& iconData);
  /// _loadDemotedAppsPlist:withError: (class operation) the dictionary in that file; none, with a message unless the
  /// file is absent or empty, when there is no such thing. Only a failed read sets `error`.
  [[nodiscard]] static std::optional<plist::Dictionary> _loadDemotedAppsPlist(platform::Platform& platform,
                                                                              std::string_view path, ErrorSlot error);

  bool prepareAppForRestoreUsingCoordination(std::string_view bundleIdentifier, ByteView harvoMetadata,
                                             const std::optional<ByteView>& sinfData,
                                             const std::optional<ByteView>& iconData,
                                             DemotionStatus demotionStatus) override;
  /// _prepareNonDemotedAppForRestoreWithBundleId:harvoMetadata:sinfData:iconData:
  bool _prepareNonDemotedAppForRestoreWithBundleId(std::string_view bundleIdentifier, ByteView harvoMetadata,
                                                   const std::optional<ByteView>& sinfData,
                                                   const std::optional<ByteView>& iconData);
  /// _prepareDemotedAppForRestoreWithBundleId:harvoMetadata:sinfData:iconData:demotionStatus:
  bool _prepareDemotedAppForRestoreWithBundleId(std::string_view bundleIdentifier, ByteView harvoMetadata,
                                                const std::optional<ByteView>& sinfData,
                                                const std::optional<ByteView>& iconData, DemotionStatus demotionStatus);
  /// _placeHolderForBundleIdentifier:withHarvoMetadata:sinfData:iconData:demotionStatus: configured, the caller's; null
  /// when it cannot be made.
  [[nodiscard]] std::shared_ptr<platform::Placeholder> _placeHolderForBundleIdentifierWithHarvoMetadata(
      std::string_view bundleIdentifier, const plist::Dictionary& harvoMetadata,
      const std::optional<ByteView>& sinfData, const std::optional<ByteView>& iconData, DemotionStatus demotionStatus);

  /// dataMigratorSetPlaceHolderPromiseForRestoreAppBundle: that app's placeholder is awaited from now on.
  void dataMigratorSetPlaceHolderPromiseForRestoreAppBundle(std::string_view bundleIdentifier);
  /// The same once `setPromise` has succeeded; no report of the placeholder is taken up between the two. Returns what
  /// `setPromise` does.
  [[nodiscard]] Status dataMigratorSetPlaceHolderPromiseForRestoreAppBundle(std::string_view bundleIdentifier,
                                                                            const std::function<Status()>& setPromise);
  /// dataMigratorCancelledCoordinatorForRestoreAppBundle: it is not awaited any more.
  void dataMigratorCancelledCoordinatorForRestoreAppBundle(std::string_view bundleIdentifier);
  /// cnDidInstallPlaceHolderForAppBundle: it has come. One without an identifier is ignored, with an error in the log.
  void cnDidInstallPlaceHolderForAppBundle(std::optional<std::string_view> bundleIdentifier);

  // ---- reporting

  /// installedAssetMetrics: how many user apps there are, and how many bytes they take.
  [[nodiscard]] plist::Dictionary installedAssetMetrics() override;
  /// corvelIDsForAssets: both identifiers of an app whose store metadata names two.
  [[nodiscard]] std::set<std::string> corvelIDsForAssets() override;
  /// accountsForAssets: of each account what the first of its apps says.
  [[nodiscard]] platform::ZTAccountInfos accountsForAssets() override;
  /// prepareForBackup: brings the store metadata of installed apps up to date.
  void prepareForBackup() override;
  /// disabledAssetTypes: "Application" where apps may be neither installed nor removed.
  [[nodiscard]] std::optional<std::set<std::string>> disabledAssetTypes() override;

 private:
  /// The registrations of a new object.
  void init();

  // Steps of the operations above.
  void _removeApps(const plist::Array& todoList, bool removalAllowed);
  void _closeOutstandingTransfers(const Identifiers& outstanding, bool success);
  [[nodiscard]] bool _preparePlaceholder(const platform::ZTAsset& asset, bool hasPlaceholder);
  [[nodiscard]] bool _prepareCoordinatedInstall(const platform::ZTAsset& asset);
  [[nodiscard]] std::shared_ptr<platform::InstallCoordinator> _usableCoordinator(std::string_view identifier,
                                                                                 bool existingApp);
  void _satisfyAppAssetPromise(const platform::ZTAsset& asset,
                               const std::shared_ptr<platform::InstallCoordinator>& coordinator);
  [[nodiscard]] bool _restoreApps(plist::DictionaryStream& info);
  void _waitForRestorePlaceholders();
  /// The identifiers of installed apps and placeholders.
  [[nodiscard]] Identifiers _userBundles();
  [[nodiscard]] bool _buildRestorePlaceholder(const std::string& folder, const PlaceholderInfo& placeholder,
                                              const std::optional<ByteView>& icon);
  void _awaitPlaceholder(std::string_view bundleIdentifier);
  [[nodiscard]] bool _stopAwaitingPlaceholder(std::string_view bundleIdentifier);
  [[nodiscard]] std::shared_ptr<platform::ZTAsset> _makeAsset(const WantedEntry& entry,
                                                              const std::optional<std::string>& displayName,
                                                              const plist::Value* restoreState);
  void _handleReceivedAsset(const std::shared_ptr<platform::ZTAsset>& asset, TransferMarks marks,
                            platform::InstallProgress* progress);
  void _handleReceivedRestoreAsset(const std::shared_ptr<platform::ZTAsset>& asset,
                                   platform::InstallProgress* progress);
  void _handleFailedTransfer(const platform::ZTAsset& asset, const std::optional<Error>& error, TransferMarks marks,
                             platform::InstallProgress* progress);
  void _cancelRestoreOfFailedTransfer(const std::string& identifier);
  [[nodiscard]] std::optional<plist::Value> _receivedPath(const platform::ZTAsset& asset);
  void _installPackage(const platform::ZTAsset& asset);
  void _scheduleInstallRetry(const std::shared_ptr<platform::ZTAsset>& asset);
  void _cancelRestoreOfFailedInstall(const std::string& identifier);
  void _removeFailedInstall(const platform::ZTAsset& asset);
  bool _installPlaceholder(const std::string& folder, const PlaceholderInfo& placeholder, std::string_view scenario,
                           const plist::Dictionary& options);

  /// The root of the restore state store: none when there is no file, null when it does not parse.
  [[nodiscard]] std::optional<plist::Value> _loadRestoreState();

  /// The home screen's icon order, saved beside; empty when it has none to give.
  [[nodiscard]] static plist::Array _savedIconOrder(platform::Platform& platform);

  // Set once, by construction.
  platform::Platform& _platform;
  const PlugInLog _log;
  /// Atomic: the registry may report a cancellation from the moment of the registration, before this is known.
  std::atomic<bool> _useInstallCoordinator = false;
  bool _runsInsideDaemon = false;
  std::unique_ptr<platform::BackupManager> _backupManager;

  // Changed only by the daemon's calls.
  std::optional<std::vector<std::string>> _uninstalledApps;
  Identifiers _klpAppsToIgnore;

  // Changed by the daemon's calls, which may report on several assets at once.
  SharedIdentifierSet _outstandingDCXTransfers;

  // Under `_accessQueue`, as are the todo list and the restore state store.
  Identifiers _updatingApps;
  Identifiers _userCancelledApps;

  // Changed under `_restoreQueue`; the wait reads the count without it.
  std::atomic<std::int64_t> _restoringPlaceholderCount = 0;
  Identifiers _placeholdersForRestoringApps;
  bool _finishedWaitingForPlaceHolderInstalls = false;

  // Counted by concurrent installs.
  std::atomic<std::uint32_t> _numAppInstallsAttempted = 0;

  // Synchronisation.
  const std::shared_ptr<Group> _installGroup;  ///< installs queued, running or waiting to be tried again; left after
                                               ///< their shares of the object and of the asset are given up
  Group _restorePlaceHoldersWaitGroup;         ///< restore placeholders still awaited
  SerialQueue _accessQueue{"com.corvel.qor.Zephtra.AppSync"};
  SerialQueue _restoreQueue{"com.corvel.qor.Zephtra.AppRestore"};
  OperationQueue _installOperationQueue;  ///< its operations use all of the above

  /// Set by the daemon's start-up notification. Last: it goes first, and its callbacks use all of the above.
  std::unique_ptr<platform::InstallObserver> _appInstallObserver;
};

/// The daemon's start-up notification: `context` is the AppsClient, or null, and then nothing happens.
void _handleZEPHStartupCompletedNotification(void* context, std::string_view name, const void* object);

// ----------------------------------------------------------------------------------------------------------------------

template <class Item>
std::vector<Item> AppsClient::_orderTheItems(platform::Platform& platform,
                                             std::map<std::string, Item, std::less<>>& items) {
  const PlugInLog log(platform.syncFramework());
  std::vector<Item> ordered;
  ordered.reserve(items.size());
  for (const plist::Value& identifier : _savedIconOrder(platform)) {
    const auto text = identifier.string();
    const auto found = text ? items.find(*text) : items.end();
    if (found == items.end()) continue;
    log.message("%s|prioritize %{public}@", identifier);
    ordered.push_back(std::move(found->second));
    items.erase(found);
  }
  for (const auto& [identifier, item] : items) {
    log.message("%s|lastly %{public}@", identifier);
    ordered.push_back(item);
  }
  return ordered;
}

}  // namespace appsync
