// A platform of fakes.
#pragma once

#include <functional>
#include <memory>
#include <utility>

#include "base/VirtualTime.h"
#include "kit/fakes/CallJournal.h"
#include "kit/fakes/FakeAppRegistry.h"
#include "kit/fakes/FakeBackupManager.h"
#include "kit/fakes/FakeBundles.h"
#include "kit/fakes/FakeDeviceService.h"
#include "kit/fakes/FakeFileSystem.h"
#include "kit/fakes/FakeHomeScreen.h"
#include "kit/fakes/FakeIcons.h"
#include "kit/fakes/FakeInstallCoordination.h"
#include "kit/fakes/FakeProfileConnection.h"
#include "kit/fakes/FakeSoftwareLibrary.h"
#include "kit/fakes/FakeSyncFramework.h"
#include "kit/fakes/FakeSystemNotify.h"
#include "kit/fakes/FakeTransactionLog.h"
#include "kit/fakes/FakeUninstalledAppsList.h"
#include "kit/fakes/RecordingLog.h"
#include "platform/Platform.h"

namespace appsync::test {

/// Each service is a stateful fake, accessible to tests as a member, and can be replaced by `use`:
///
///     FakePlatform platform;
///     platform.registry.add(FakeApp::placeholder("com.a"));
///     platform.use(myHomeScreen);
///
/// Each fake documents its behaviour, its journal lines and the misuse that it detects. Clients must be destroyed
/// before the platform: a service fails the test if an object of it is still held.
///
/// The fakes use each other, not their replacements: registry, bundles, icons and coordination read from `files`,
/// coordination installs into `registry`, and `registry` adds removals to `uninstalledList`. To replace one of these
/// three, also replace the fakes that use it.
class FakePlatform final : public platform::Platform {
 public:
  CallJournal journal;
  RecordingLog log;
  FakeFileSystem files{journal};
  FakeUninstalledAppsList uninstalledList{journal};
  FakeAppRegistry registry{journal, files, uninstalledList};
  FakeSyncFramework framework{journal, log};
  FakeHomeScreen screen{journal};
  FakeProfileConnection restrictions{journal};
  FakeTransactionLog transactions{journal};
  FakeSystemLog systemLogs{journal};
  FakeSystemNotify notify{journal};
  FakeBundles bundleFolders{journal, files};
  FakeIconRenderer icons{journal, files};
  FakePNGEncoders encoders{journal};
  FakeBackups backups{journal};
  FakeStore store{journal};
  // Destroyed before the services above, which may receive their last callbacks.
  FakeDeviceService deviceService{journal};
  FakeInstallCoordination coordination{journal, files, registry};
  /// Clock and scheduler. Destroyed first, with its pending tasks and everything that they own.
  VirtualTime time;

  // The caller owns the replacement, which must outlive the platform.
  void use(platform::SyncFramework& service) { syncFramework_ = &service; }
  void use(platform::ZTDeviceService& service) { sharedInstance_ = &service; }
  void use(platform::AppRegistry& service) { defaultRegistry_ = &service; }
  void use(platform::UninstalledAppsList& service) { uninstalledApps_ = &service; }
  void use(platform::InstallCoordination& service) { installCoordination_ = &service; }
  void use(platform::HomeScreenService& service) { homeScreen_ = &service; }
  void use(platform::ProfileConnection& service) { sharedConnection_ = &service; }
  void use(platform::TransactionLog& service) { transactionLog_ = &service; }
  void use(platform::SystemLog& service) { systemLog_ = &service; }
  void use(platform::SystemNotify& service) { systemNotify_ = &service; }
  void use(platform::Bundles& service) { bundles_ = &service; }
  void use(platform::IconRenderer& service) { iconRenderer_ = &service; }
  void use(platform::PNGEncoders& service) { pngEncoders_ = &service; }
  void use(platform::FileSystem& service) { fileSystem_ = &service; }
  void use(Clock& service) { clock_ = &service; }
  void use(Scheduler& service) { scheduler_ = &service; }
  void useBackupManagers(std::function<std::unique_ptr<platform::BackupManager>()> make) {
    makeBackupManager_ = std::move(make);
  }
  void useSoftwareLibraries(std::function<std::unique_ptr<platform::SoftwareLibrary>()> make) {
    makeSoftwareLibrary_ = std::move(make);
  }

  [[nodiscard]] platform::SyncFramework& syncFramework() override { return *syncFramework_; }
  [[nodiscard]] platform::ZTDeviceService& sharedInstance() override { return *sharedInstance_; }
  [[nodiscard]] platform::AppRegistry& defaultRegistry() override { return *defaultRegistry_; }
  [[nodiscard]] platform::UninstalledAppsList& uninstalledApps() override { return *uninstalledApps_; }
  [[nodiscard]] platform::InstallCoordination& installCoordination() override { return *installCoordination_; }
  [[nodiscard]] platform::HomeScreenService& homeScreen() override { return *homeScreen_; }
  [[nodiscard]] platform::ProfileConnection& sharedConnection() override { return *sharedConnection_; }
  [[nodiscard]] platform::TransactionLog& transactionLog() override { return *transactionLog_; }
  [[nodiscard]] platform::SystemLog& systemLog() override { return *systemLog_; }
  [[nodiscard]] platform::SystemNotify& systemNotify() override { return *systemNotify_; }
  [[nodiscard]] platform::Bundles& bundles() override { return *bundles_; }
  [[nodiscard]] platform::IconRenderer& iconRenderer() override { return *iconRenderer_; }
  [[nodiscard]] platform::PNGEncoders& pngEncoders() override { return *pngEncoders_; }
  [[nodiscard]] platform::FileSystem& fileSystem() override { return *fileSystem_; }
  [[nodiscard]] Clock& clock() override { return *clock_; }
  [[nodiscard]] Scheduler& scheduler() override { return *scheduler_; }
  [[nodiscard]] std::unique_ptr<platform::BackupManager> makeBackupManager() override { return makeBackupManager_(); }
  [[nodiscard]] std::unique_ptr<platform::SoftwareLibrary> makeSoftwareLibrary() override {
    return makeSoftwareLibrary_();
  }

 private:
  platform::SyncFramework* syncFramework_ = &framework;
  platform::ZTDeviceService* sharedInstance_ = &deviceService;
  platform::AppRegistry* defaultRegistry_ = &registry;
  platform::UninstalledAppsList* uninstalledApps_ = &uninstalledList;
  platform::InstallCoordination* installCoordination_ = &coordination;
  platform::HomeScreenService* homeScreen_ = &screen;
  platform::ProfileConnection* sharedConnection_ = &restrictions;
  platform::TransactionLog* transactionLog_ = &transactions;
  platform::SystemLog* systemLog_ = &systemLogs;
  platform::SystemNotify* systemNotify_ = &notify;
  platform::Bundles* bundles_ = &bundleFolders;
  platform::IconRenderer* iconRenderer_ = &icons;
  platform::PNGEncoders* pngEncoders_ = &encoders;
  platform::FileSystem* fileSystem_ = &files;
  Clock* clock_ = &time;
  Scheduler* scheduler_ = &time;
  std::function<std::unique_ptr<platform::BackupManager>()> makeBackupManager_ = [this] { return backups.connect(); };
  std::function<std::unique_ptr<platform::SoftwareLibrary>()> makeSoftwareLibrary_ = [this] { return store.connect(); };
};

}  // namespace appsync::test
