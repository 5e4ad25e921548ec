// The sync daemon, and the host that it talks to, for one sync.
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

/// Makes the fixed sequence of calls with which a daemon drives its client through a sync, and does meanwhile what the
/// device's services, and other processes, ask of it. One object, one sync.
class Daemon {
 public:
  /// All must outlive it.
  Daemon(device::Device& device, platform::ZTClient& client, host::SyncProgress& progress,
         const host::Interruption& interruption);

  /// Runs the sync. Every app concerned has its outcome in the progress when it returns. Fails when the device cannot
  /// be synced at all; what was to be done, if that is known, is then told as failed.
  [[nodiscard]] Status sync(const SyncRequest& request);

 private:
  struct NotSent {
    host::AppEvent event;
    Error error;
  };

  void learnDeletedApps();
  [[nodiscard]] Status planSync(const SyncRequest& request);
  void wakeDemotedApps(const std::map<std::string, host::DeviceApp, std::less<>>& apps);
  [[nodiscard]] Status handOverInstructions();
  void transferPackages(InstallWatcher& watcher);
  /// Tells the client that the data of a restored app, which the device keeps, has come too.
  void handOverData(const std::shared_ptr<platform::ZTAsset>& asset);
  void transfer(const std::shared_ptr<platform::ZTAsset>& asset, InstallWatcher& watcher);
  void tellWhatIsKnown();
  void tellRemovals(InstallWatcher& watcher);
  void tellUnfinished();
  /// Why a package did not reach the device, which `error` is only one answer to.
  [[nodiscard]] NotSent endOf(const host::PlannedApp& app, const Error& error) const;
  void failEverything(const Error& error);
  [[nodiscard]] const host::PlannedApp* planned(std::string_view identifier) const;
  [[nodiscard]] Status remember();

  device::Device& device_;
  platform::ZTClient& client_;
  host::SyncProgress& progress_;
  const host::Interruption& interruption_;
  host::PackageSender sender_;
  TransferQueue queue_;
  host::HostState state_;
  std::vector<host::PlannedApp> plan_;
  std::map<std::string_view, const host::PlannedApp*> transfers_;  // those in plan_ that have a package, by identifier
};

}  // namespace appsync::daemon
