// The sync daemon, and the host that it talks to, for one sync.
#pragma once

#include <map>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "base/Error.h"
#include "device/Device.h"
#include "platform/ZTClient.h"
#include "tools/HostState.h"
#include "tools/InstallWatcher.h"
#include "tools/Interruption.h"
#include "tools/PackageSender.h"
#include "tools/StoreRun.h"
#include "tools/SyncPlan.h"
#include "tools/SyncProgress.h"
#include "tools/TransferQueue.h"

namespace appsync::tools {

struct SyncRequest {
  const Library& library;
  IdentifierSet only;
  IdentifierSet remove;
};

/// Makes the fixed sequence of calls with which a daemon drives its client through a sync, and does meanwhile what the
/// device's services, and other processes, ask of it. One object, one sync.
class Daemon {
 public:
  /// All must outlive it.
  Daemon(device::Device& device, platform::ZTClient& client, SyncProgress& progress, const Interruption& interruption);

  /// Runs the sync. Every app concerned has its outcome in the progress when it returns. Fails when the device cannot
  /// be synced at all; what was to be done, if that is known, is then told as failed.
  [[nodiscard]] Status sync(const SyncRequest& request);

 private:
  struct NotSent {
    AppEvent event;
    Error error;
  };

  void learnDeletedApps();
  [[nodiscard]] Status planSync(const SyncRequest& request);
  void wakeDemotedApps(const std::map<std::string, DeviceApp, std::less<>>& apps);
  [[nodiscard]] Status handOverInstructions();
  void transferPackages(InstallWatcher& watcher);
  /// Tells the client that the data of a restored app, which the device keeps, has come too.
  void handOverData(const std::shared_ptr<platform::ZTAsset>& asset);
  void transfer(const std::shared_ptr<platform::ZTAsset>& asset, InstallWatcher& watcher);
  void tellWhatIsKnown();
  void tellRemovals(InstallWatcher& watcher);
  void tellUnfinished();
  /// Why a package did not reach the device, which `error` is only one answer to.
  [[nodiscard]] NotSent endOf(const PlannedApp& app, const Error& error) const;
  void failEverything(const Error& error);
  [[nodiscard]] const PlannedApp* planned(std::string_view identifier) const;
  [[nodiscard]] Status remember();

  device::Device& device_;
  platform::ZTClient& client_;
  SyncProgress& progress_;
  const Interruption& interruption_;
  PackageSender sender_;
  TransferQueue queue_;
  HostState state_;
  std::vector<PlannedApp> plan_;
  std::map<std::string_view, const PlannedApp*> transfers_;  // those in plan_ that have a package, by identifier
};

}  // namespace appsync::tools
