// The services of a device.
#pragma once

#include <memory>

#include "base/SystemClock.h"
#include "base/ThreadScheduler.h"
#include "device/apps/AppRegistry.h"
#include "device/apps/BackupManager.h"
#include "device/apps/Bundles.h"
#include "device/apps/SoftwareLibrary.h"
#include "device/apps/UninstalledApps.h"
#include "device/coordination/InstallCoordination.h"
#include "device/screen/HomeScreen.h"
#include "device/screen/IconRenderer.h"
#include "device/screen/PNGEncoders.h"
#include "device/services/DeviceService.h"
#include "device/services/Restrictions.h"
#include "device/services/Settings.h"
#include "device/services/SyncFramework.h"
#include "device/services/SystemNotify.h"
#include "device/services/TransactionLog.h"
#include "device/storage/Database.h"
#include "device/storage/DeviceFileSystem.h"
#include "platform/Platform.h"

namespace appsync::device {

/// The device's implementation of the platform, with concrete types.
class Services final : public platform::Platform {
 public:
  /// The statements that create every table.
  static constexpr const char* kSchemas[] = {
      AppRegistry::kSchema,    UninstalledApps::kSchema, Settings::kSchema,
      HomeScreen::kSchema,     BackupManager::kSchema,   SoftwareLibrary::kSchema,
      TransactionLog::kSchema, SystemNotify::kSchema,    InstallCoordination::kSchema};

  /// `database` and `files` must outlive the services.
  Services(Database& database, DeviceFileSystem& files, Access access)
      : database_(database),
        files_(files),
        registry_(database, files, access),
        uninstalledApps_(database),
        settings_(database),
        homeScreen_(database, registry_, settings_),
        restrictions_(settings_),
        transactionLog_(database),
        systemNotify_(database),
        bundles_(files),
        iconRenderer_(files),
        scheduler_(clock_),
        installCoordination_(database, files, registry_, settings_, access) {}

  [[nodiscard]] SyncFramework& syncFramework() override { return syncFramework_; }
  [[nodiscard]] DeviceService& sharedInstance() override { return deviceService_; }
  [[nodiscard]] AppRegistry& defaultRegistry() override { return registry_; }
  [[nodiscard]] UninstalledApps& uninstalledApps() override { return uninstalledApps_; }
  [[nodiscard]] InstallCoordination& installCoordination() override { return installCoordination_; }
  [[nodiscard]] HomeScreen& homeScreen() override { return homeScreen_; }
  [[nodiscard]] Restrictions& sharedConnection() override { return restrictions_; }
  [[nodiscard]] TransactionLog& transactionLog() override { return transactionLog_; }
  [[nodiscard]] SystemLog& systemLog() override { return systemLog_; }
  [[nodiscard]] SystemNotify& systemNotify() override { return systemNotify_; }
  [[nodiscard]] Bundles& bundles() override { return bundles_; }
  [[nodiscard]] IconRenderer& iconRenderer() override { return iconRenderer_; }
  [[nodiscard]] PNGEncoders& pngEncoders() override { return pngEncoders_; }
  [[nodiscard]] DeviceFileSystem& fileSystem() override { return files_; }
  [[nodiscard]] Clock& clock() override { return clock_; }
  [[nodiscard]] ThreadScheduler& scheduler() override { return scheduler_; }

  [[nodiscard]] std::unique_ptr<platform::BackupManager> makeBackupManager() override {
    return std::make_unique<BackupManager>(database_, files_);
  }
  [[nodiscard]] std::unique_ptr<platform::SoftwareLibrary> makeSoftwareLibrary() override {
    return std::make_unique<SoftwareLibrary>(database_, registry_);
  }

  // For tools.

  [[nodiscard]] Settings& settings() noexcept { return settings_; }
  [[nodiscard]] Database& database() noexcept { return database_; }

 private:
  Database& database_;
  DeviceFileSystem& files_;
  AppRegistry registry_;
  UninstalledApps uninstalledApps_;
  Settings settings_;
  HomeScreen homeScreen_;
  Restrictions restrictions_;
  TransactionLog transactionLog_;
  SystemLog systemLog_;
  SystemNotify systemNotify_;
  Bundles bundles_;
  IconRenderer iconRenderer_;
  PNGEncoders pngEncoders_;
  SyncFramework syncFramework_;
  DeviceService deviceService_;
  SystemClock clock_;
  ThreadScheduler scheduler_;
  /// Declared last so that it is destroyed first: its threads use the other services.
  InstallCoordination installCoordination_;
};

}  // namespace appsync::device
