// Contract subjects of the fakes.
#include <atomic>
#include <utility>

#include "kit/contracts/AppRegistryContract.h"
#include "kit/contracts/BackupManagerContract.h"
#include "kit/contracts/BundlesContract.h"
#include "kit/contracts/FileSystemContract.h"
#include "kit/contracts/HomeScreenContract.h"
#include "kit/contracts/IconsContract.h"
#include "kit/contracts/InstallCoordinationContract.h"
#include "kit/contracts/PlatformContract.h"
#include "kit/contracts/ProfileConnectionContract.h"
#include "kit/contracts/SoftwareLibraryContract.h"
#include "kit/contracts/SyncFrameworkContract.h"
#include "kit/contracts/SystemNotifyContract.h"
#include "kit/contracts/TimeContract.h"
#include "kit/contracts/TransactionLogContract.h"
#include "kit/contracts/UninstalledAppsListContract.h"
#include "kit/contracts/ZTDeviceServiceContract.h"
#include "kit/fakes/FakePackages.h"
#include "kit/fakes/FakePlatform.h"
#include "kit/fakes/SyncFileBuilder.h"
#include "platform/Keys.h"

namespace appsync::test {

namespace {

constexpr std::string_view kFolder = "/var/contract";

class FakeFiles final : public FileSystemSubject {
 public:
  FakeFiles() { platform_.files.putFolder(kFolder); }
  platform::FileSystem& fileSystem() override { return platform_.files; }
  std::string folder() override { return std::string(kFolder); }
  bool makeLink(std::string_view path, std::string_view target) override {
    platform_.files.putLink(path, target);
    return true;
  }
  std::optional<platform::OwnerAttributes> ownersOf(std::string_view path) override {
    return platform_.files.owners(path);
  }
  bool makeOld(std::string_view) override { return true; }
  bool isOld(std::string_view path) override { return platform_.files.touches(path) == 0; }

 private:
  FakePlatform platform_;
};

class FakeRegistrySubject final : public AppRegistrySubject {
 public:
  platform::AppRegistry& registry() override { return platform_.registry; }
  platform::UninstalledAppsList& uninstalledApps() override { return platform_.uninstalledList; }

  platform::FileLocation makePackage(std::string_view identifier, std::string_view version) override {
    const std::string path = newPath();
    platform_.files.put(path, packageOf(identifier, version));
    return {path, false};
  }
  platform::FileLocation makeDamagedPackage(std::string_view) override {
    const std::string path = newPath();
    platform_.files.put(path, "");
    return {path, false};
  }
  platform::FileLocation makePlaceholderFolder(std::string_view identifier, std::string_view version) override {
    const std::string path = newPath();
    platform_.files.put(path + "/Info.plist", packageOf(identifier, version));
    return {path, true};
  }
  void removeLocation(const platform::FileLocation& location) override { platform_.files.erase(location.path); }
  std::string fingerprint(const platform::FileLocation& location) override {
    return platform_.files.text(location.isDirectory ? location.path + "/Info.plist" : location.path).value_or("");
  }

  bool isUsable(std::string_view bundlePath) override {
    for (const std::string& identifier : platform_.registry.identifiers()) {
      const FakeApp app = *platform_.registry.app(identifier);
      if (app.isInstalled && app.bundlePath == bundlePath) return true;
    }
    return false;
  }
  void changeInstallOrder() override {
    platform_.registry.add(FakeApp::placeholder("com.first"));
    platform_.registry.setInstallOrder({"com.first"});
  }
  bool addExtension(std::string_view identifier) override {
    platform_.registry.addBundle(std::string(identifier), platform::BundleKind::user);
    return true;
  }
  bool addSystemApp(std::string_view identifier) override {
    platform_.registry.add(FakeApp::installed(std::string(identifier)).ofType(platform::kApplicationTypeSystem));
    return true;
  }
  std::optional<std::string> storeMetadataOf(std::string_view identifier) override {
    return optionOf(identifier, platform::kStoreMetadataKey);
  }
  std::optional<std::string> licenceDataOf(std::string_view identifier) override {
    return optionOf(identifier, platform::kLicenceDataKey);
  }

 private:
  std::optional<std::string> optionOf(std::string_view identifier, std::string_view key) {
    const FakeApp app = *platform_.registry.app(identifier);
    const plist::Value* value = app.installOptions.find(key);
    if (value == nullptr || !value->data()) return "(none)";
    return std::string(textOf(*value->data()));
  }
  std::string newPath() { return std::string(kFolder).append("/").append(std::to_string(++made_)); }

  FakePlatform platform_;
  int made_ = 0;
};

class FakeUninstalledApps final : public UninstalledAppsListSubject {
 public:
  platform::UninstalledAppsList& list() override { return platform_.uninstalledList; }
  void removeRealApp(std::string_view identifier) override { platform_.uninstalledList.add(identifier); }
  void installApp(std::string_view identifier) override { platform_.uninstalledList.remove(identifier); }
  bool failClearing() override {
    platform_.uninstalledList.failClearingWith(5);
    return true;
  }

 private:
  FakePlatform platform_;
};

class FakeScreen final : public HomeScreenSubject {
 public:
  FakeScreen() { platform_.screen.answerAlways("com.unknown", AssertionAnswer::notFound()); }
  platform::HomeScreenService& homeScreen() override { return platform_.screen; }
  void addApp(std::string_view identifier) override {
    order_.emplace_back(identifier);
    platform_.screen.setFlattenedIconState(order_);
  }
  bool denyAssertions(std::string_view identifier) override {
    platform_.screen.answerAlways(identifier, AssertionAnswer::denied());
    return true;
  }

 private:
  FakePlatform platform_;
  std::vector<std::string> order_;
};

/// Closes its connections before the service is destroyed.
class FakeBackupsSubject final : public BackupManagerSubject {
 public:
  std::unique_ptr<platform::BackupManager> makeManager() override { return platform_.makeBackupManager(); }
  void keepRestoreData(std::string_view identifier, std::uint64_t size) override {
    platform_.backups.addRestoreData(identifier, size);
  }
  bool failCancelling() override {
    platform_.backups.failures.failAlways(BackupOperation::cancelApplicationRestore, kAnything,
                                          {"Backup", 1, "busy", nullptr});
    return true;
  }

 private:
  FakePlatform platform_;
};

template <RefreshCompletion when>
class FakeLibraries final : public SoftwareLibrarySubject {
 public:
  FakeLibraries() { platform_.store.completeRefreshes(when); }
  std::unique_ptr<platform::SoftwareLibrary> makeLibrary() override { return platform_.makeSoftwareLibrary(); }
  bool failRefreshes() override {
    platform_.store.completeRefreshes(when, Error{"Store", 1, "no connection", nullptr});
    return true;
  }

 private:
  FakePlatform platform_;
};

class FakeProfiles final : public ProfileConnectionSubject {
 public:
  platform::ProfileConnection& connection() override { return platform_.restrictions; }
  void set(platform::RestrictionSetting setting, platform::RestrictionValue value) override {
    platform_.restrictions.set(setting, value);
  }

 private:
  FakePlatform platform_;
};

class FakeTransactions final : public TransactionLogSubject {
 public:
  platform::TransactionLog& log() override { return platform_.transactions; }
  platform::SystemLog& systemLog() override { return platform_.systemLogs; }
  std::vector<KeptEntry> entries() override {
    std::vector<KeptEntry> kept;
    for (const StepEntry& entry : platform_.transactions.steps()) {
      kept.push_back({static_cast<std::uint32_t>(entry.step), std::nullopt, entry.party, entry.phase,
                      entry.success == Success::yes, entry.bundleIdentifier, entry.description});
    }
    for (const ScenarioEntry& entry : platform_.transactions.scenarios()) {
      kept.push_back({entry.step, entry.scenario, std::nullopt, std::nullopt, entry.success == Success::yes,
                      entry.bundleIdentifier, entry.description});
    }
    return kept;
  }

 private:
  FakePlatform platform_;
};

class FakeNotifications final : public SystemNotifySubject {
 public:
  platform::SystemNotify& notify() override { return platform_.notify; }
  std::optional<std::uint64_t> stateOf(std::string_view name) override { return platform_.notify.state(name); }

 private:
  FakePlatform platform_;
};

class FakeBundlesSubject final : public BundlesSubject {
 public:
  FakeBundlesSubject() { platform_.files.putFolder(kFolder); }
  platform::Bundles& bundles() override { return platform_.bundleFolders; }
  std::string folder() override { return std::string(kFolder); }
  void put(std::string_view path, std::string_view contents) override { platform_.files.put(path, contents); }

 private:
  FakePlatform platform_;
};

class FakeIconsSubject final : public IconsSubject {
 public:
  platform::IconRenderer& renderer() override { return platform_.icons; }
  platform::PNGEncoders& encoders() override { return platform_.encoders; }
  std::unique_ptr<platform::Bundle> makeApp(IconKind icon) override {
    const std::string folder = std::string(kFolder).append("/").append(std::to_string(++made_)).append(".app");
    putAppFolder(platform_.files, folder, "com.a", "A");
    if (icon == IconKind::damaged) platform_.files.put(folder + "/Icon.png", "");
    if (icon == IconKind::missingFile) platform_.files.erase(folder + "/Icon.png");
    if (icon == IconKind::notNamed) putPropertyList(platform_.files, folder + "/Info.plist", plist::Dictionary());
    return platform_.bundleFolders.openBundle({folder, true});
  }

 private:
  FakePlatform platform_;
  int made_ = 0;
};

class FakeCoordination final : public InstallCoordinationSubject {
 public:
  platform::InstallCoordination& coordination() override { return platform_.coordination; }

 private:
  FakePlatform platform_;
};

class FakeCoordinatedInstalls final : public CoordinatedInstallSubject {
 public:
  FakeCoordinatedInstalls() {
    platform_.coordination.enable();
    platform_.coordination.installAutomatically();
  }
  platform::InstallCoordination& coordination() override { return platform_.coordination; }
  platform::AppRegistry& registry() override { return platform_.registry; }
  platform::UninstalledAppsList& uninstalledApps() override { return platform_.uninstalledList; }

  platform::FileLocation makePackage(std::string_view identifier, std::string_view version) override {
    return put(textOf(packageOf(identifier, version)));
  }
  platform::FileLocation makeDamagedPackage(std::string_view) override { return put(""); }
  platform::FileLocation makeIcon() override { return put("a picture"); }
  bool exists(const platform::FileLocation& location) override { return platform_.files.has(location.path); }

  void prioritize(std::string_view identifier) override { platform_.coordination.prioritize(identifier); }
  void cancelByUser(std::string_view identifier) override { platform_.coordination.cancelByUser(identifier); }
  void waitUntilIdle() override { platform_.coordination.waitUntilIdle(); }
  std::optional<plist::Dictionary> storeMetadataOf(std::string_view identifier) override {
    const FakeApp app = *platform_.registry.app(identifier);
    const plist::Value* kept = app.installOptions.find(platform::kStoreMetadataKey);
    if (kept == nullptr || !kept->data()) return plist::Dictionary();
    return *plist::read(*kept->data()).value().dictionary();
  }

 private:
  platform::FileLocation put(std::string_view contents) {
    const std::string path = std::string(kFolder).append("/").append(std::to_string(++made_));
    platform_.files.put(path, contents);
    return {path, false};
  }

  FakePlatform platform_;
  std::atomic<int> made_ = 0;
};

class FakeDaemonsService final : public ZTDeviceServiceSubject {
 public:
  platform::ZTDeviceService& service() override { return platform_.deviceService; }

 private:
  FakePlatform platform_;
};

class FakeFramework final : public SyncFrameworkSubject {
 public:
  platform::SyncFramework& framework() override { return platform_.framework; }
  std::vector<std::string> loggedLines() override { return platform_.log.messages(); }

 private:
  FakePlatform platform_;
};

class WholeFakePlatform final : public PlatformSubject {
 public:
  platform::Platform& platform() override { return platform_; }

 private:
  FakePlatform platform_;
};

class FakeTime final : public TimeSubject {
 public:
  Clock& clock() override { return time_; }
  Scheduler& scheduler() override { return time_; }
  void pass(Duration duration) override { time_.advance(duration); }

 private:
  VirtualTime time_;
};

constexpr auto kInline = RefreshCompletion::beforeReturn;
constexpr auto kOnThread = RefreshCompletion::onOwnThread;

}  // namespace

INSTANTIATE_TEST_SUITE_P(Fakes, FileSystemContract,
                         testing::Values(implementation<FileSystemSubject, FakeFiles>("Fake")), implementationName);
INSTANTIATE_TEST_SUITE_P(Fakes, AppRegistryContract,
                         testing::Values(implementation<AppRegistrySubject, FakeRegistrySubject>("Fake")),
                         implementationName);
INSTANTIATE_TEST_SUITE_P(Fakes, UninstalledAppsListContract,
                         testing::Values(implementation<UninstalledAppsListSubject, FakeUninstalledApps>("Fake")),
                         implementationName);
INSTANTIATE_TEST_SUITE_P(Fakes, HomeScreenContract,
                         testing::Values(implementation<HomeScreenSubject, FakeScreen>("Fake")), implementationName);
INSTANTIATE_TEST_SUITE_P(Fakes, BackupManagerContract,
                         testing::Values(implementation<BackupManagerSubject, FakeBackupsSubject>("Fake")),
                         implementationName);
INSTANTIATE_TEST_SUITE_P(
    Fakes, SoftwareLibraryContract,
    testing::Values(implementation<SoftwareLibrarySubject, FakeLibraries<kInline>>("FakeBeforeReturn"),
                    implementation<SoftwareLibrarySubject, FakeLibraries<kOnThread>>("FakeOnOwnThread")),
    implementationName);
INSTANTIATE_TEST_SUITE_P(Fakes, ProfileConnectionContract,
                         testing::Values(implementation<ProfileConnectionSubject, FakeProfiles>("Fake")),
                         implementationName);
INSTANTIATE_TEST_SUITE_P(Fakes, TransactionLogContract,
                         testing::Values(implementation<TransactionLogSubject, FakeTransactions>("Fake")),
                         implementationName);
INSTANTIATE_TEST_SUITE_P(Fakes, SystemNotifyContract,
                         testing::Values(implementation<SystemNotifySubject, FakeNotifications>("Fake")),
                         implementationName);
INSTANTIATE_TEST_SUITE_P(Fakes, BundlesContract,
                         testing::Values(implementation<BundlesSubject, FakeBundlesSubject>("Fake")),
                         implementationName);
INSTANTIATE_TEST_SUITE_P(Fakes, IconsContract, testing::Values(implementation<IconsSubject, FakeIconsSubject>("Fake")),
                         implementationName);
INSTANTIATE_TEST_SUITE_P(Fakes, InstallCoordinationContract,
                         testing::Values(implementation<InstallCoordinationSubject, FakeCoordination>("Fake")),
                         implementationName);
INSTANTIATE_TEST_SUITE_P(Fakes, CoordinatedInstallContract,
                         testing::Values(implementation<CoordinatedInstallSubject, FakeCoordinatedInstalls>("Fake")),
                         implementationName);
INSTANTIATE_TEST_SUITE_P(Fakes, ZTDeviceServiceContract,
                         testing::Values(implementation<ZTDeviceServiceSubject, FakeDaemonsService>("Fake")),
                         implementationName);
INSTANTIATE_TEST_SUITE_P(Fakes, SyncFrameworkContract,
                         testing::Values(implementation<SyncFrameworkSubject, FakeFramework>("Fake")),
                         implementationName);
INSTANTIATE_TEST_SUITE_P(Fakes, PlatformContract,
                         testing::Values(implementation<PlatformSubject, WholeFakePlatform>("Fake")),
                         implementationName);
INSTANTIATE_TEST_SUITE_P(Fakes, TimeContract, testing::Values(implementation<TimeSubject, FakeTime>("VirtualTime")),
                         implementationName);

}  // namespace appsync::test
