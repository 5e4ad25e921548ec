// The sync daemon and its host, for one sync.
#pragma once

#include <map>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "base/Error.h"
#include "daemon/InstallWatcher.h"
#include "daemon/StoreRun.h"
#include "daemon/TransferQueue.h"
#include "device/Device.h"
#include "host/HostState.h"
#include "host/InterruptSignals.h"
#include "host/PackageSender.h"
#include "host/SyncPlan.h"
#include "host/SyncProgress.h"
#include "platform/ZTClient.h"

namespace appsync::daemon {

struct SyncRequest {
  const host::Library& library;
  host::IdentifierSet only;
  host::IdentifierSet remove;
};

/// Drives the client through a sync with the fixed sequence of calls, and serves requests of the device's services and
/// of other processes meanwhile. One object serves one sync.
class Daemon {
 public:
  /// All arguments must outlive it.
  Daemon(device::Device& device, platform::ZTClient& client, host::SyncProgress& progress,
         const host::InterruptSignals& interruption);

  /// Runs the sync. Every planned app is reported with its outcome before it returns. Fails if the device cannot be
  /// synced; every planned app is then reported as failed.
  [[nodiscard]] Status sync(const SyncRequest& request);

 private:
  struct TransferFailure {
    host::AppEvent event;
    Error error;
  };

  void recordDeletedApps();
  [[nodiscard]] Status planSync(const SyncRequest& request);
  void markDemotedAppsAsRestored(const std::map<std::string, host::DeviceApp, std::less<>>& apps);
  [[nodiscard]] Status handOverInstructions();
  void transferPackages(InstallWatcher& watcher);
  /// Notifies the client that the data of a restored app, which the device keeps, is available.
  void handOverData(const std::shared_ptr<platform::ZTAsset>& asset);
  void transfer(const std::shared_ptr<platform::ZTAsset>& asset, InstallWatcher& watcher);
  void reportDecidedApps();
  void reportRemovals(InstallWatcher& watcher);
  void reportUnfinishedApps();
  /// Returns why a package was not sent: a cancellation or an interruption, or else `error`.
  [[nodiscard]] TransferFailure transferFailureOf(const host::PlannedApp& app, const Error& error) const;
  void failEverything(const Error& error);
  [[nodiscard]] const host::PlannedApp* planned(std::string_view identifier) const;
  [[nodiscard]] Status saveState();

  device::Device& device_;
  platform::ZTClient& client_;
  host::SyncProgress& progress_;
  const host::InterruptSignals& interruption_;
  host::PackageSender sender_;
  TransferQueue queue_;
  host::HostState state_;
  std::vector<host::PlannedApp> plan_;
  std::map<std::string_view, const host::PlannedApp*> transfers_;  // entries of plan_ with a package, by identifier
};

}  // namespace appsync::daemon
