// What the sync daemon asks of a client that syncs one dataclass.
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

/// What the daemon posts, system-wide, once it is up and its clients are made.
inline constexpr std::string_view kZTStartupCompleteNotification = "com.corvel.zeph.ZTStartupCompleteNotification";

/// The restore type of a device that a host has restored. Others are the daemon's own.
inline constexpr std::int32_t kRestoreTypeHost = 2;

/// Keys of `installedAssetMetrics`, each with an unsigned 64-bit number.
inline constexpr std::string_view kMetricCount = "_Count";                  ///< items of the dataclass
inline constexpr std::string_view kMetricPhysicalSize = "_PhysicalSize";    ///< bytes that they take
inline constexpr std::string_view kMetricPurgeableSize = "_PurgeableSize";  ///< of these, bytes that can be freed

/// The daemon drives a client with these calls, one sync at a time and in this order: `prepareForSyncWithHostAnchor`,
/// `installedAssets`, `reconcileSync`, `outstandingAssetTransfers`, the transfers' reports,
/// `assetTransferEndedWithSuccess`, `syncEndedWithSuccess`. A sync that breaks off, wherever it does, still gets the
/// last two, with false: a sync that was refused as well. `clearSyncData` and the questions may come at any time
/// between syncs. `reconcileRestoreOfType` comes once after a restore, before the first sync.
///
/// Threads: calls come from the daemon's threads, not two at once, but for the reports on different assets' transfers
/// of which several may run side by side. They run synchronously; `assetTransferEndedWithSuccess` blocks until all
/// installs are done and `reconcileRestoreOfType` waits for placeholders, so none may be made from work of the client's
/// own. Assets are never null, and a transfer that failed always comes with an error: without one a client would take
/// the package for whole. Errors: slots may be null; only a false result makes what is in one an answer.
class ZTClient {
 public:
  virtual ~ZTClient() = default;

  [[nodiscard]] virtual std::vector<std::string> supportedDataclasses() = 0;
  [[nodiscard]] virtual std::string currentSyncAnchor() = 0;
  virtual bool prepareForSyncWithHostAnchor(std::string_view hostAnchor, const ProgressCallback& progressCallback,
                                            ErrorSlot error) = 0;
  /// The host's view of what the device holds; see `AppsClient` for the keys.
  [[nodiscard]] virtual plist::Dictionary installedAssets() = 0;
  virtual bool reconcileSync(const Assets& assets, std::string_view newAnchor, const ProgressCallback& progressCallback,
                             ErrorSlot error) = 0;
  /// The packages that the host is to send, in the order in which they are wanted.
  [[nodiscard]] virtual Assets outstandingAssetTransfers() = 0;
  virtual void assetTransferUpdatedProgress(const std::shared_ptr<ZTAsset>& asset, double fraction) = 0;
  virtual void assetTransferSucceeded(const std::shared_ptr<ZTAsset>& asset, bool succeeded,
                                      const std::optional<Error>& error) = 0;
  virtual void assetTransferEndedWithSuccess(bool success) = 0;
  virtual void syncEndedWithSuccess(bool success) = 0;
  virtual void clearSyncData() = 0;

  /// Takes up what the host left on a restored device.
  virtual bool reconcileRestoreOfType(std::int32_t restoreType, ErrorSlot error) = 0;

  /// What the dataclass takes on the device, by the keys above, and nothing else. The caller's own.
  [[nodiscard]] virtual plist::Dictionary installedAssetMetrics() = 0;
  /// The identifiers of the store accounts that own what is on the device, as they were found there: empty, in other
  /// letters or with blanks around them too. What cannot be read names no account and fails nothing.
  [[nodiscard]] virtual std::set<std::string> corvelIDsForAssets() = 0;
  /// The same accounts with what is known of them, one of each identifier.
  [[nodiscard]] virtual ZTAccountInfos accountsForAssets() = 0;
  /// The device is about to be backed up.
  virtual void prepareForBackup() = 0;
  /// The dataclasses that this device cannot sync at all as it is set up; none when there is no such.
  [[nodiscard]] virtual std::optional<std::set<std::string>> disabledAssetTypes() = 0;
};

}  // namespace appsync::platform
