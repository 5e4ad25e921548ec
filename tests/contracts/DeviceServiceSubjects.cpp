// Contract subjects of the embedded device's services.
#include <atomic>
#include <chrono>
#include <fstream>
#include <memory>
#include <string>
#include <vector>

#include "kit/contracts/BackupManagerContract.h"
#include "kit/contracts/BundlesContract.h"
#include "kit/contracts/HomeScreenContract.h"
#include "kit/contracts/IconsContract.h"
#include "kit/contracts/InstallCoordinationContract.h"
#include "kit/contracts/PlatformContract.h"
#include "kit/contracts/ProfileConnectionContract.h"
#include "kit/contracts/SoftwareLibraryContract.h"
#include "kit/contracts/SyncFrameworkContract.h"
#include "kit/contracts/SystemNotifyContract.h"
#include "kit/contracts/TransactionLogContract.h"
#include "kit/contracts/ZTDeviceServiceContract.h"
#include "kit/fakes/FakeDeviceService.h"
#include "platform/Keys.h"
#include "tests/device/screen/Pictures.h"
#include "tests/support/TestDevice.h"

namespace appsync::test {

namespace {

constexpr std::string_view kFolder = "/var/contract";

void put(device::DeviceFileSystem& files, const std::string& path, ByteView bytes) {
  const std::string folder = path.substr(0, path.rfind('/'));
  EXPECT_TRUE(files.createDirectory(folder, platform::IntermediateDirectories::create, {}));
  EXPECT_TRUE(files.writeFileAtomically(path, bytes));
}

class DeviceHomeScreen final : public HomeScreenSubject {
 public:
  platform::HomeScreenService& homeScreen() override { return device_.services().homeScreen(); }
  void addApp(std::string_view identifier) override {
    const std::string folder = "/tmp/" + std::string(identifier) + ".app";
    const std::string info = "{BundleIdentifier = \"" + std::string(identifier) + "\";}";
    put(device_.files(), folder + "/Info.plist", bytesOf(info));
    EXPECT_TRUE(device_.registry().installApplication({folder, true}, TestDevice::placeholderOptions(identifier)));
  }
  std::optional<std::string> layoutOf(const std::vector<std::string>& identifiers) override {
    plist::Array page;
    for (const std::string& identifier : identifiers)
      page.emplace_back(identifier);
    const Bytes layout = plist::writeBinary(plist::Array{plist::Array{std::move(page)}}).value();
    return std::string(textOf(layout));
  }
  bool denyAssertions(std::string_view identifier) override {
    return device_.services().settings().setAssertionAnswer(identifier, device::AssertionAnswer::denied).ok();
  }

 private:
  TestDevice device_;
};

class DeviceBackups final : public BackupManagerSubject {
 public:
  std::unique_ptr<platform::BackupManager> makeManager() override { return device_.services().makeBackupManager(); }
  void keepRestoreData(std::string_view identifier, std::uint64_t size) override {
    device::Database::Session session(device_.services().database());
    EXPECT_TRUE(session.run("insert into restore_data values (?, ?)", identifier, size));
  }

 private:
  TestDevice device_;
};

class DeviceLibraries final : public SoftwareLibrarySubject {
 public:
  std::unique_ptr<platform::SoftwareLibrary> makeLibrary() override { return device_.services().makeSoftwareLibrary(); }
  bool failRefreshes() override {
    device::Database::Session session(device_.services().database());
    return session.runScript("drop table receipts").ok();
  }

 private:
  TestDevice device_;
};

class DeviceRestrictions final : public ProfileConnectionSubject {
 public:
  platform::ProfileConnection& connection() override { return device_.services().sharedConnection(); }
  void set(platform::RestrictionSetting setting, platform::RestrictionValue value) override {
    const bool isInstallation = setting == platform::RestrictionSetting::appInstallationAllowed;
    EXPECT_TRUE(device_.services().settings().set(isInstallation ? "app-installation" : "app-removal", word(value)));
  }

 private:
  static std::string_view word(platform::RestrictionValue value) {
    if (value == platform::RestrictionValue::unset) return "unset";
    return value == platform::RestrictionValue::yes ? "yes" : "no";
  }

  TestDevice device_;
};

class DeviceTransactions final : public TransactionLogSubject {
 public:
  platform::TransactionLog& log() override { return device_.services().transactionLog(); }
  platform::SystemLog& systemLog() override { return device_.services().systemLog(); }
  std::vector<KeptEntry> entries() override {
    const auto entries = device_.services().transactionLog().entries();
    EXPECT_TRUE(entries);
    std::vector<KeptEntry> kept;
    for (const device::TransactionEntry& entry : *entries) {
      kept.push_back({entry.step, entry.scenario, entry.party, entry.phase, entry.success, entry.bundleIdentifier,
                      entry.description});
    }
    return kept;
  }

 private:
  TestDevice device_;
};

class DeviceNotifications final : public SystemNotifySubject {
 public:
  platform::SystemNotify& notify() override { return device_.services().systemNotify(); }
  std::optional<std::uint64_t> stateOf(std::string_view name) override {
    return device_.services().systemNotify().state(name);
  }

 private:
  TestDevice device_;
};

class DeviceBundles final : public BundlesSubject {
 public:
  DeviceBundles() {
    EXPECT_TRUE(device_.files().createDirectory(kFolder, platform::IntermediateDirectories::create, {}));
  }
  platform::Bundles& bundles() override { return device_.services().bundles(); }
  std::string folder() override { return std::string(kFolder); }
  void put(std::string_view path, std::string_view contents) override {
    test::put(device_.files(), std::string(path), bytesOf(contents));
  }

 private:
  TestDevice device_;
};

class DeviceIcons final : public IconsSubject {
 public:
  platform::IconRenderer& renderer() override { return device_.services().iconRenderer(); }
  platform::PNGEncoders& encoders() override { return device_.services().pngEncoders(); }
  std::unique_ptr<platform::Bundle> makeApp(IconKind icon) override {
    const std::string folder = std::string(kFolder) + "/" + std::to_string(++made_) + ".app";
    const bool isNamed = icon != IconKind::notNamed;
    put(device_.files(), folder + "/Info.plist", bytesOf(isNamed ? "{BundleIconFile = \"Icon.png\";}" : "{}"));
    Bytes png = makePNG(60, 60, kGreen);
    if (icon == IconKind::damaged) png.resize(png.size() / 2);
    if (icon != IconKind::missingFile) put(device_.files(), folder + "/Icon.png", png);
    return device_.services().bundles().openBundle({folder, true});
  }

 private:
  TestDevice device_;
  int made_ = 0;
};

class DeviceCoordination final : public InstallCoordinationSubject {
 public:
  platform::InstallCoordination& coordination() override { return device_.services().installCoordination(); }

 private:
  TestDevice device_;
};

class DeviceInstalls final : public CoordinatedInstallSubject {
 public:
  platform::InstallCoordination& coordination() override { return service(); }
  platform::AppRegistry& registry() override { return device_.registry(); }
  platform::UninstalledAppsList& uninstalledApps() override { return device_.services().uninstalledApps(); }

  platform::FileLocation makePackage(std::string_view identifier, std::string_view version) override {
    return device_.stage(newName(), appPackage(identifier, version));
  }
  platform::FileLocation makeDamagedPackage(std::string_view identifier) override {
    std::string package = appPackage(identifier);
    package.resize(package.size() / 2);
    return device_.stage(newName(), package);
  }
  platform::FileLocation makeIcon() override { return device_.stage(newName(), textOf(makePNG(60, 60, kGreen))); }
  bool exists(const platform::FileLocation& location) override { return device_.files().fileExists(location.path); }

  void prioritize(std::string_view identifier) override { EXPECT_TRUE(service().prioritize(identifier)); }
  void cancelByUser(std::string_view identifier) override { EXPECT_TRUE(service().cancelByUser(identifier).ok()); }
  void waitUntilIdle() override { EXPECT_TRUE(service().waitUntilIdle(std::chrono::minutes(5))); }

  std::optional<plist::Dictionary> storeMetadataOf(std::string_view identifier) override {
    const std::string container = device_.record(identifier)->bundleContainerPath().value();
    const Result<Bytes> kept = device_.files().readFile(container + "/HarvoMetadata.plist");
    return kept ? *plist::read(*kept).value().dictionary() : plist::Dictionary();
  }
  bool restart() override {
    device_.reopen();
    return true;
  }

 private:
  device::InstallCoordination& service() { return device_.services().installCoordination(); }
  std::string newName() { return std::to_string(++made_); }

  TestDevice device_{device::InstallMode::coordinated};
  std::atomic<int> made_ = 0;
};

/// A device service with a running daemon.
class DeviceAndDaemon final : public ZTDeviceServiceSubject {
 public:
  DeviceAndDaemon() { service_.connect(&daemon_); }
  ~DeviceAndDaemon() override { service_.connect(nullptr); }
  DeviceAndDaemon(const DeviceAndDaemon&) = delete;
  DeviceAndDaemon& operator=(const DeviceAndDaemon&) = delete;
  platform::ZTDeviceService& service() override { return service_; }

 private:
  CallJournal journal_;
  FakeDeviceService daemon_{journal_};
  device::DeviceService service_;
};

class DeviceFramework final : public SyncFrameworkSubject {
 public:
  DeviceFramework() { device_.services().syncFramework().logTo(device::FileLogSink::open(log_).value()); }
  platform::SyncFramework& framework() override { return device_.services().syncFramework(); }
  std::vector<std::string> loggedLines() override {
    std::vector<std::string> lines;
    std::ifstream file(log_);
    for (std::string line; std::getline(file, line);)
      lines.push_back(line);
    return lines;
  }

 private:
  TestDevice device_;
  const std::string log_ = device_.path() + ".log";
};

class WholeDevice final : public PlatformSubject {
 public:
  platform::Platform& platform() override { return device_.services(); }

 private:
  TestDevice device_;
};

}  // namespace

INSTANTIATE_TEST_SUITE_P(Device, HomeScreenContract,
                         testing::Values(implementation<HomeScreenSubject, DeviceHomeScreen>("Device")),
                         implementationName);
INSTANTIATE_TEST_SUITE_P(Device, BackupManagerContract,
                         testing::Values(implementation<BackupManagerSubject, DeviceBackups>("Device")),
                         implementationName);
INSTANTIATE_TEST_SUITE_P(Device, SoftwareLibraryContract,
                         testing::Values(implementation<SoftwareLibrarySubject, DeviceLibraries>("Device")),
                         implementationName);
INSTANTIATE_TEST_SUITE_P(Device, ProfileConnectionContract,
                         testing::Values(implementation<ProfileConnectionSubject, DeviceRestrictions>("Device")),
                         implementationName);
INSTANTIATE_TEST_SUITE_P(Device, TransactionLogContract,
                         testing::Values(implementation<TransactionLogSubject, DeviceTransactions>("Device")),
                         implementationName);
INSTANTIATE_TEST_SUITE_P(Device, SystemNotifyContract,
                         testing::Values(implementation<SystemNotifySubject, DeviceNotifications>("Device")),
                         implementationName);
INSTANTIATE_TEST_SUITE_P(Device, BundlesContract,
                         testing::Values(implementation<BundlesSubject, DeviceBundles>("Device")), implementationName);
INSTANTIATE_TEST_SUITE_P(Device, IconsContract, testing::Values(implementation<IconsSubject, DeviceIcons>("Device")),
                         implementationName);
INSTANTIATE_TEST_SUITE_P(Device, InstallCoordinationContract,
                         testing::Values(implementation<InstallCoordinationSubject, DeviceCoordination>("Device")),
                         implementationName);
INSTANTIATE_TEST_SUITE_P(Device, CoordinatedInstallContract,
                         testing::Values(implementation<CoordinatedInstallSubject, DeviceInstalls>("Device")),
                         implementationName);
INSTANTIATE_TEST_SUITE_P(Device, ZTDeviceServiceContract,
                         testing::Values(implementation<ZTDeviceServiceSubject, DeviceAndDaemon>("Device")),
                         implementationName);
INSTANTIATE_TEST_SUITE_P(Device, SyncFrameworkContract,
                         testing::Values(implementation<SyncFrameworkSubject, DeviceFramework>("Device")),
                         implementationName);
INSTANTIATE_TEST_SUITE_P(Device, PlatformContract,
                         testing::Values(implementation<PlatformSubject, WholeDevice>("Device")), implementationName);

}  // namespace appsync::test
