// Every service that the plug-in reaches the world through, in one bundle.
#pragma once

#include <memory>

#include "base/Clock.h"
#include "base/Scheduler.h"
#include "platform/AppRegistry.h"
#include "platform/BackupManager.h"
#include "platform/Bundle.h"
#include "platform/FileSystem.h"
#include "platform/HomeScreenService.h"
#include "platform/IconRenderer.h"
#include "platform/InstallCoordination.h"
#include "platform/ProfileConnection.h"
#include "platform/SoftwareLibrary.h"
#include "platform/SyncFramework.h"
#include "platform/SystemNotify.h"
#include "platform/TransactionLog.h"
#include "platform/UninstalledAppsList.h"
#include "platform/ZTDeviceService.h"

namespace appsync::platform {

/// A device maker implements this, and with it every service, to run the plug-in on their device.
///
/// Each accessor returns the same object every time; all live as long as the bundle, which outlives every object of the
/// plug-in. Threads: accessors and factories may be called from any thread.
class Platform {
 public:
  virtual ~Platform() = default;

  [[nodiscard]] virtual SyncFramework& syncFramework() = 0;
  /// The one device service of the running daemon.
  [[nodiscard]] virtual ZTDeviceService& sharedInstance() = 0;
  [[nodiscard]] virtual AppRegistry& defaultRegistry() = 0;
  [[nodiscard]] virtual UninstalledAppsList& uninstalledApps() = 0;
  [[nodiscard]] virtual InstallCoordination& installCoordination() = 0;
  [[nodiscard]] virtual HomeScreenService& homeScreen() = 0;
  [[nodiscard]] virtual ProfileConnection& sharedConnection() = 0;
  [[nodiscard]] virtual TransactionLog& transactionLog() = 0;
  [[nodiscard]] virtual SystemLog& systemLog() = 0;
  [[nodiscard]] virtual SystemNotify& systemNotify() = 0;
  [[nodiscard]] virtual Bundles& bundles() = 0;
  [[nodiscard]] virtual IconRenderer& iconRenderer() = 0;
  [[nodiscard]] virtual PNGEncoders& pngEncoders() = 0;
  [[nodiscard]] virtual FileSystem& fileSystem() = 0;
  [[nodiscard]] virtual Clock& clock() = 0;
  [[nodiscard]] virtual Scheduler& scheduler() = 0;

  /// New connections, owned by the caller; never null.
  [[nodiscard]] virtual std::unique_ptr<BackupManager> makeBackupManager() = 0;
  [[nodiscard]] virtual std::unique_ptr<SoftwareLibrary> makeSoftwareLibrary() = 0;
};

}  // namespace appsync::platform
