// The interface through which the sync daemon drives a client that syncs one dataclass.
#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include "base/Error.h"
#include "platform/ZTAsset.h"
#include "platform/ZTMutableAccountInfo.h"
#include "plist/PropertyList.h"

namespace appsync::platform {

using Assets = std::vector<std::shared_ptr<ZTAsset>>;
using ProgressCallback = std::function<void(double fraction)>;

/// Posted by the daemon, system-wide, once it has started and created its clients.
inline constexpr std::string_view kZTStartupCompleteNotification = "com.corvel.zeph.ZTStartupCompleteNotification";

/// The restore type of a device that was restored by a host. The daemon defines the others.
inline constexpr std::int32_t kRestoreTypeHost = 2;

/// Keys of `installedAssetMetrics`, each with an unsigned 64-bit number.
inline constexpr std::string_view kMetricCount = "_Count";                  ///< items of the dataclass
inline constexpr std::string_view kMetricPhysicalSize = "_PhysicalSize";    ///< bytes that they occupy
inline constexpr std::string_view kMetricPurgeableSize = "_PurgeableSize";  ///< of these, bytes that can be freed

/// A sync consists of these calls, in this order: `prepareForSyncWithHostAnchor`, `installedAssets`, `reconcileSync`,
/// `outstandingAssetTransfers`, `assetTransferUpdatedProgress` and `assetTransferSucceeded` for each asset,
/// `assetTransferEndedWithSuccess`, `syncEndedWithSuccess`. If a sync is aborted or refused at any point, the daemon
/// still calls the last two, with false. Syncs do not overlap. `clearSyncData` and the queries may be called at any
/// time between syncs; `reconcileRestoreOfType` is called once after a restore, before the first sync.
///
/// Threads: the daemon calls from its own threads, one call at a time, except that the reports of different assets'
/// transfers may be concurrent. All calls are synchronous. `assetTransferEndedWithSuccess` blocks until all installs
/// have ended and `reconcileRestoreOfType` waits for placeholders; to avoid a deadlock, no call may be made from the
/// client's own threads. Assets are never null. A failed transfer must have an error: without one the client treats the
/// package as complete. Error slots may be null and are meaningful only if the result is false.
class ZTClient {
 public:
  virtual ~ZTClient() = default;

  [[nodiscard]] virtual std::vector<std::string> supportedDataclasses() = 0;
  /// Returns the client's state of synchronization, for the host to compare. A client may return a constant.
  [[nodiscard]] virtual std::string currentSyncAnchor() = 0;
  /// Begins a sync. Returns false and sets `error` if the client refuses it. A client need not report progress.
  virtual bool prepareForSyncWithHostAnchor(std::string_view hostAnchor, const ProgressCallback& progressCallback,
                                            ErrorSlot error) = 0;
  /// Returns the installed assets and the deleted ones, for the host; `AppsClient` documents the keys.
  [[nodiscard]] virtual plist::Dictionary installedAssets() = 0;
  /// Applies the host's instructions from its staging directory. Returns false and sets `error` if the sync cannot go
  /// on. A client need not report progress.
  virtual bool reconcileSync(const Assets& assets, std::string_view newAnchor, const ProgressCallback& progressCallback,
                             ErrorSlot error) = 0;
  /// Returns the packages that the host is to send, in the requested order.
  [[nodiscard]] virtual Assets outstandingAssetTransfers() = 0;
  /// Reports the received fraction of the package, from 0 to 1.
  virtual void assetTransferUpdatedProgress(const std::shared_ptr<ZTAsset>& asset, double fraction) = 0;
  /// Reports the end of one transfer. After a success the client owns the package at the asset's path and may install
  /// it asynchronously.
  virtual void assetTransferSucceeded(const std::shared_ptr<ZTAsset>& asset, bool succeeded,
                                      const std::optional<Error>& error) = 0;
  /// Reports the end of all transfers. Blocks until all installs have ended.
  virtual void assetTransferEndedWithSuccess(bool success) = 0;
  virtual void syncEndedWithSuccess(bool success) = 0;
  /// Resets the client: deletes its sync state and removes all placeholders.
  virtual void clearSyncData() = 0;

  /// Processes the host's restore file on a restored device. Returns false and sets `error` on failure.
  virtual bool reconcileRestoreOfType(std::int32_t restoreType, ErrorSlot error) = 0;

  /// Returns the storage used by the dataclass: a dictionary of exactly the three keys above.
  [[nodiscard]] virtual plist::Dictionary installedAssetMetrics() = 0;
  /// Returns the identifiers of the store accounts that own the dataclass's assets, unmodified: they may be empty,
  /// differ in case only, or have surrounding blanks. Ignores unreadable metadata.
  [[nodiscard]] virtual std::set<std::string> corvelIDsForAssets() = 0;
  /// Returns the accounts of `corvelIDsForAssets` with their details, one for each identifier.
  [[nodiscard]] virtual ZTAccountInfos accountsForAssets() = 0;
  /// Called before the device is backed up.
  virtual void prepareForBackup() = 0;
  /// Returns the dataclasses that this device's configuration disables, or nullopt if there are none.
  [[nodiscard]] virtual std::optional<std::set<std::string>> disabledAssetTypes() = 0;
};

}  // namespace appsync::platform
