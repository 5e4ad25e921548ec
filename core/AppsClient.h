// The plug-in: the sync daemon's client for the dataclass "Application".
#pragma once

#include <atomic>
#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <mutex>
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

namespace appsync {

struct EndedTransfer;

/// One object, made once by the daemon and kept for the life of the process. Installs, removes and prepares apps as the
/// host's todo list asks, and writes the state of each app back into that list.
///
/// Threads: as `platform::ZTClient` says. Nothing is thrown; failures go to the log, and to error slots where the
/// daemon gives one. Queued installs, scheduled retries and running callbacks of a coordinator share the ownership of
/// the object, so its destructor may run on any thread; it waits for callbacks of the services that it observes.
///
/// Class operations need no object and take the platform instead. An operation or field whose name begins with an
/// underscore is internal to the plug-in; such an operation is public if a test or another component calls it.
class AppsClient final : public platform::ZTClient,
                         public platform::AppRegistryObserver,
                         public platform::InstallObserverDelegate,
                         public AppInstallUsingCoordination,
                         public std::enable_shared_from_this<AppsClient> {
  struct Token {};  // Only create() makes one.

 public:
  // ---- core: lifecycle
  /// Returns the object, registered with the platform's services, which must outlive it. Never null.
  [[nodiscard]] static std::shared_ptr<AppsClient> create(platform::Platform& platform);

  AppsClient(Token, platform::Platform& platform);
  ~AppsClient() override;
  [[nodiscard]] std::string description() const { return "<AppsClient>"; }

  // ---- core: the daemon's calls, in the order of a sync
  [[nodiscard]] std::vector<std::string> supportedDataclasses() override;
  /// currentSyncAnchor: returns a constant; the plug-in keeps no anchor.
  [[nodiscard]] std::string currentSyncAnchor() override;
  bool prepareForSyncWithHostAnchor(std::string_view hostAnchor, const platform::ProgressCallback& progressCallback,
                                    ErrorSlot error) override;
  /// installedAssets: returns { "_Deleted": apps known to the host that are no longer on the device }.
  [[nodiscard]] plist::Dictionary installedAssets() override;
  /// reconcileSync:withNewAnchor:progressCallback:error: returns false only if the work area cannot be made or filled.
  bool reconcileSync(const platform::Assets& assets, std::string_view newAnchor,
                     const platform::ProgressCallback& progressCallback, ErrorSlot error) override;
  void assetTransferEndedWithSuccess(bool success) override;
  void syncEndedWithSuccess(bool success) override;
  /// clearSyncData: deletes all sync files and removes all placeholders.
  void clearSyncData() override;

  // ---- core: called by the other components
  /// _appInstallationAllowed, _appRemovalAllowed: return false only if a restriction forbids it.
  [[nodiscard]] bool _appInstallationAllowed();
  [[nodiscard]] bool _appRemovalAllowed();
  [[nodiscard]] std::int32_t _getAndResetNumAppInstallsAttempted();

  /// _loadPlist:withError: (class operation) returns the array in that file, or nullopt.
  [[nodiscard]] static std::optional<plist::Array> _loadPlist(platform::Platform& platform, std::string_view path,
                                                              ErrorSlot error);
  /// _notifySolvary: (class operation) notifies the home screen that a sync is starting, or done.
  static void _notifySolvary(platform::Platform& platform, bool starting);
  /// _orderTheItems: (class operation) returns the items in on-screen order of their icons, then the others. Removes
  /// the former from `items`.
  template <class Item>
  [[nodiscard]] static std::vector<Item> _orderTheItems(platform::Platform& platform,
                                                        std::map<std::string, Item, std::less<>>& items) {
    std::vector<Item> ordered;
    for (const std::string& identifier : _prioritized(platform, identifiersOf(items)))
      ordered.push_back(std::move(items.extract(identifier).mapped()));
    for (const auto& [identifier, item] : items)
      ordered.push_back(item);
    return ordered;
  }

  // ---- transfer
  /// outstandingAssetTransfers: returns the packages that the host must still send, each with its placeholder made.
  [[nodiscard]] platform::Assets outstandingAssetTransfers() override;
  /// assetTransfer:updatedProgress:, assetTransfer:succeeded:withError:
  void assetTransferUpdatedProgress(const std::shared_ptr<platform::ZTAsset>& asset, double fraction) override;
  void assetTransferSucceeded(const std::shared_ptr<platform::ZTAsset>& asset, bool succeeded,
                              const std::optional<Error>& error) override;
  /// _progressForAssetIdentifier: returns null if the app has no progress, or installs are coordinated.
  [[nodiscard]] std::shared_ptr<platform::InstallProgress> _progressForAssetIdentifier(std::string_view identifier);

  /// _enqueueAssetInstall: queues one install and returns; _performAssetInstall: runs one on the calling thread.
  void _enqueueAssetInstall(const std::shared_ptr<platform::ZTAsset>& asset);
  void _performAssetInstall(const std::shared_ptr<platform::ZTAsset>& asset);
  /// assetInstallSucceeded:, assetInstallFailed:withError:
  void assetInstallSucceeded(const platform::ZTAsset& asset);
  void assetInstallFailed(const platform::ZTAsset& asset, const Error& error);
  [[nodiscard]] bool _isRecoverableError(const std::optional<Error>& error);

  /// placeholderAppPathForBundleIdentifier: returns the path at which that app's placeholder bundle is built.
  [[nodiscard]] std::string placeholderAppPathForBundleIdentifier(std::string_view bundleIdentifier);
  /// createPlaceHolderPath:forBundleIdentifier:withAttributes:
  bool createPlaceHolderPath(std::string_view path, std::string_view bundleIdentifier,
                             const platform::OwnerAttributes& attributes);
  /// writeIconData:atPath:returningFileSize:forBundleIdentifier:withAttributes: returns false without an icon.
  /// `fileSize` may be null and is set only if the size is known.
  bool writeIconData(const std::optional<ByteView>& icon, std::string_view path, std::uint64_t* fileSize,
                     std::string_view bundleIdentifier, const platform::OwnerAttributes& attributes);
  /// _makeIconFromBundlePath:saveTo: (class operation)
  static bool _makeIconFromBundlePath(platform::Platform& platform, const std::optional<std::string>& bundlePath,
                                      std::string_view destination);
  /// _createPlaceHolderApplication: builds and installs a placeholder; failures are only logged.
  void _createPlaceHolderApplication(const platform::ZTAsset& asset);

  // ---- coordination
  bool prepareAppForInstallUsingCoordination(const platform::ZTAsset& asset, bool existingApp) override;
  /// updateTransferProgressForApp:existingApp: returns false if no coordinator waits for the package.
  bool updateTransferProgressForApp(const platform::ZTAsset& asset, bool existingApp);
  /// transferCompleteForApp:withError:isExistingApp: hands the package, or the reason of its failure, to the service.
  void transferCompleteForApp(const platform::ZTAsset& asset, const std::optional<Error>& error, bool isExistingApp);
  /// assetSyncFinishedWithStatus:outstandingItems: cancels the coordinators of these after a failed sync.
  void assetSyncFinishedWithStatus(bool success, const IdentifierSet& outstandingItems);
  void uninstallAppUsingCoordination(std::string_view bundleIdentifier) override;

  /// _initiatingOrUpdatingAppInstallCoordinatorForBundleIdentifier:existingApp:createIfNotExisting:error: returns null
  /// if there is none that the plug-in may change. Sets `error` to the service's error, or nullopt.
  [[nodiscard]] std::shared_ptr<platform::InstallCoordinator>
  _initiatingOrUpdatingAppInstallCoordinatorForBundleIdentifier(std::string_view bundleIdentifier, bool existingApp,
                                                                bool createIfNotExisting, ErrorSlot error);
  /// _placeHolderForBundleIdentifier:name:installType: returns null if it cannot be made.
  [[nodiscard]] std::shared_ptr<platform::Placeholder> _placeHolderForBundleIdentifier(
      std::string_view bundleIdentifier, std::string_view name, platform::TSInstallType installType);
  /// _createAppAssetPromiseForBundleIdentifier:atPath:andAddToCoordinatinator: null if it cannot be made or attached.
  std::shared_ptr<platform::PromisedTransferToPath> _createAppAssetPromiseForBundleIdentifier(
      std::string_view bundleIdentifier, const std::optional<std::string>& path,
      const std::shared_ptr<platform::InstallCoordinator>& coordinator);
  /// _createIconPromiseForBundleIdentifier:transferPath:diskSpaceNeeded:andAddToPlaceHolder:forAppInstall: returns a
  /// fulfilled promise, or null if it cannot be made or attached.
  std::shared_ptr<platform::PromisedTransferToPath> _createIconPromiseForBundleIdentifier(
      std::string_view bundleIdentifier, std::string_view transferPath, std::uint64_t diskSpaceNeeded,
      const std::shared_ptr<platform::Placeholder>& placeHolder, bool forAppInstall);
  /// _userDataPromiseForBundleIdentifier: returns a fulfilled promise, attached to nothing, or null.
  [[nodiscard]] std::shared_ptr<platform::PromisedOutOfBandTransfer> _userDataPromiseForBundleIdentifier(
      std::string_view bundleIdentifier);

  // ---- coordination: callbacks of the services, on their threads
  /// setupInstallCoordinatorObserver: opens the observer connection unless it is open.
  void setupInstallCoordinatorObserver();
  void coordinatorDidInstallPlaceholder(platform::InstallCoordinator& coordinator) override;
  void coordinatorDidCompleteSuccessfully(platform::InstallCoordinator& coordinator) override;
  void coordinatorShouldPrioritize(platform::InstallCoordinator& coordinator) override;
  void coordinatorCanceledWithReason(platform::InstallCoordinator& coordinator, const Error& reason,
                                     platform::ClientIdentity client) override;
  void promiseDidBeginFulfillmentWithIdentifier(std::uint64_t identifier) override;
  void applicationInstallsDidCancel(const platform::AppRecords& records) override;

  // ---- restore: restore state and todo list
  // Not thread-safe: each reads and rewrites a whole file. Callers must run them on `_accessQueue`.

  /// _restoreStatePropertyForKey:identifier:version: returns nullopt for a missing level or a non-string version.
  [[nodiscard]] std::optional<plist::Value> _restoreStatePropertyForKey(std::string_view key,
                                                                        std::string_view identifier,
                                                                        const plist::Value* version);
  /// _setRestoreStatePropertyValue:forKey:identifier:version: does nothing for a non-string version.
  void _setRestoreStatePropertyValue(const plist::Value& value, std::string_view key, std::string_view identifier,
                                     const plist::Value* version);
  /// cleanRestoreStateForIdentifier: deletes every version of it.
  void cleanRestoreStateForIdentifier(std::string_view identifier);
  /// changeAssetID:toDo:, _operationStateForIdentifier: set and return the operation of the identifier's first entry.
  void changeAssetID(std::string_view identifier, std::string_view toDo);
  [[nodiscard]] std::optional<plist::Value> _operationStateForIdentifier(std::string_view identifier);

  // ---- restore: placeholders
  using PlaceholderVisitor = std::function<void(const platform::AppRecord& record, bool& stop)>;

  /// _placeholderExistsForApplication: returns false if installs are coordinated.
  [[nodiscard]] bool _placeholderExistsForApplication(std::string_view bundleIdentifier);
  /// _enumeratePlaceholdersWithBlock: calls `visit` on the calling thread, before it returns.
  void _enumeratePlaceholdersWithBlock(const PlaceholderVisitor& visit);
  [[nodiscard]] IdentifierSet _getSystemAppPlaceholders();

  // ---- restore: the host's restore file
  /// reconcileRestoreOfType:withError: never fails. Blocks for at most five seconds per placeholder.
  bool reconcileRestoreOfType(std::int32_t restoreType, ErrorSlot error) override;
  /// _processHarvoRestoreInfo: returns the result for the last app that needed a placeholder, false if none did, and
  /// true without a restore file.
  bool _processHarvoRestoreInfo();
  /// _processHarvoRestoreInfoForApp:harvoMetaData:sinfData:iconData: builds a placeholder and has it installed. Returns
  /// true also for metadata that cannot be parsed.
  bool _processHarvoRestoreInfoForApp(std::string_view bundleIdentifier, ByteView harvoMetaData,
                                      const std::optional<ByteView>& sinfData, const std::optional<ByteView>& iconData);
  /// _loadDemotedAppsPlist:withError: (class operation) returns the dictionary in that file, or nullopt.
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
  /// _placeHolderForBundleIdentifier:withHarvoMetadata:sinfData:iconData:demotionStatus: returns a configured
  /// placeholder, or null if it cannot be made.
  [[nodiscard]] std::shared_ptr<platform::Placeholder> _placeHolderForBundleIdentifierWithHarvoMetadata(
      std::string_view bundleIdentifier, const plist::Dictionary& harvoMetadata,
      const std::optional<ByteView>& sinfData, const std::optional<ByteView>& iconData, DemotionStatus demotionStatus);

  /// dataMigratorSetPlaceHolderPromiseForRestoreAppBundle: starts to await that app's placeholder.
  void dataMigratorSetPlaceHolderPromiseForRestoreAppBundle(std::string_view bundleIdentifier);
  /// Calls `setPromise` and, if it succeeds, starts to await that app's placeholder, before any report of it is
  /// processed. Returns the status of `setPromise`.
  [[nodiscard]] Status _awaitPlaceholderAfter(const std::function<Status()>& setPromise,
                                              std::string_view bundleIdentifier);
  /// dataMigratorCancelledCoordinatorForRestoreAppBundle: stops awaiting it.
  void dataMigratorCancelledCoordinatorForRestoreAppBundle(std::string_view bundleIdentifier);
  /// cnDidInstallPlaceHolderForAppBundle: records that it is installed; without an identifier only logs an error.
  void cnDidInstallPlaceHolderForAppBundle(std::optional<std::string_view> bundleIdentifier);

  // ---- reporting
  [[nodiscard]] plist::Dictionary installedAssetMetrics() override;
  [[nodiscard]] std::set<std::string> corvelIDsForAssets() override;
  [[nodiscard]] platform::ZTAccountInfos accountsForAssets() override;
  void prepareForBackup() override;
  [[nodiscard]] std::optional<std::set<std::string>> disabledAssetTypes() override;

 private:
  void init();
  /// Logs `identifiers` in on-screen order of their icons, then the others; returns the former in that order.
  [[nodiscard]] static std::vector<std::string> _prioritized(platform::Platform& platform, IdentifierSet identifiers);

  // Steps of the operations above that need the object's fields.
  [[nodiscard]] bool _prepareCoordinatedInstall(const platform::ZTAsset& asset);
  void _handleReceivedAsset(const EndedTransfer& transfer);
  void _handleReceivedRestoreAsset(const EndedTransfer& transfer);
  void _handleFailedTransfer(const EndedTransfer& transfer);
  void _scheduleInstallRetry(const std::shared_ptr<platform::ZTAsset>& asset);
  void _waitForRestorePlaceholders();

  // Set once, by construction.
  platform::Platform& _platform;
  const PlugInLog _log;
  /// Atomic: the registry may report a cancellation from the moment of the registration, before this is known.
  std::atomic<bool> _useInstallCoordinator = false;
  bool _runsInsideDaemon = false;
  std::unique_ptr<platform::BackupManager> _backupManager;

  // Changed only by the daemon's calls.
  std::optional<std::vector<std::string>> _uninstalledApps;
  IdentifierSet _klpAppsToIgnore;

  // Under `_accessQueue`, as are the todo list and the restore state.
  IdentifierSet _updatingApps;
  IdentifierSet _userCancelledApps;

  // Changed under `_restoreQueue`; the wait reads the count without it.
  std::atomic<std::int64_t> _restoringPlaceholderCount = 0;
  IdentifierSet _placeholdersForRestoringApps;
  bool _finishedWaitingForPlaceHolderInstalls = false;

  // Changed by concurrent installs, and by concurrent reports on transfers.
  std::atomic<std::uint32_t> _numAppInstallsAttempted = 0;
  std::mutex _outstandingMutex;
  IdentifierSet _outstandingDCXTransfers;  ///< under `_outstandingMutex`

  // Synchronisation.
  const std::shared_ptr<Group> _installGroup;  ///< pending installs; left after they release the object and the asset
  Group _restorePlaceHoldersWaitGroup;         ///< restore placeholders still awaited
  SerialQueue _accessQueue{"com.corvel.qor.Zephtra.AppSync"};
  SerialQueue _restoreQueue{"com.corvel.qor.Zephtra.AppRestore"};
  OperationQueue _installOperationQueue;  ///< its operations use all of the above

  /// Set by the daemon's start-up notification. Declared last so that it is destroyed first: its callbacks use every
  /// member above.
  std::unique_ptr<platform::InstallObserver> _appInstallObserver;
};

/// The daemon's start-up notification. Does nothing if `context`, the AppsClient, is null.
void _handleZEPHStartupCompletedNotification(void* context, std::string_view name, const void* object);

}  // namespace appsync
