// All platform services that the plug-in uses.
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

/// A port implements this interface and every service in it.
///
/// Each accessor always returns the same object, which lives as long as the platform. The platform must outlive every
/// object of the plug-in. Accessors and factories are thread-safe and never fail.
class Platform {
 public:
  virtual ~Platform() = default;

  [[nodiscard]] virtual SyncFramework& syncFramework() = 0;
  /// The daemon's device service.
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

  /// Return a new connection, never null, owned by the caller.
  [[nodiscard]] virtual std::unique_ptr<BackupManager> makeBackupManager() = 0;
  [[nodiscard]] virtual std::unique_ptr<SoftwareLibrary> makeSoftwareLibrary() = 0;
};

}  // namespace appsync::platform
