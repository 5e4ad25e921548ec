// Contract subjects of the embedded device's files, registry and time. Each subject has its own device.
#include <chrono>
#include <filesystem>

#include "kit/contracts/AppRegistryContract.h"
#include "kit/contracts/FileSystemContract.h"
#include "kit/contracts/TimeContract.h"
#include "kit/contracts/UninstalledAppsListContract.h"
#include "tests/support/TestDevice.h"

namespace appsync::test {

namespace {

constexpr std::string_view kFolder = "/var/contract";

/// Writes a file and its missing parent directories on the device.
void putFile(const TestDevice& device, std::string_view path, std::string_view contents) {
  std::filesystem::create_directories(std::filesystem::path(device.host(path)).parent_path());
  writeHostFile(device.host(path), contents);
}

class DeviceFiles final : public FileSystemSubject {
 public:
  DeviceFiles() { std::filesystem::create_directories(device_.host(kFolder)); }
  platform::FileSystem& fileSystem() override { return device_.files(); }
  std::string folder() override { return std::string(kFolder); }
  bool makeLink(std::string_view path, std::string_view target) override {
    std::filesystem::create_symlink(target, device_.host(path));
    return true;
  }
  std::optional<platform::OwnerAttributes> ownersOf(std::string_view path) override {
    const Result<platform::OwnerAttributes> owners = device_.files().ownersOfItem(path);
    // Not every host file system stores extended attributes.
    if (!owners || !owners->ownerAccountName) return std::nullopt;
    return *owners;
  }
  bool makeOld(std::string_view path) override {
    std::filesystem::last_write_time(device_.host(path), longAgo());
    return true;
  }
  bool isOld(std::string_view path) override {
    return std::filesystem::last_write_time(device_.host(path)) < longAgo() + std::chrono::hours(1);
  }

 private:
  static std::filesystem::file_time_type longAgo() {
    return std::filesystem::file_time_type::clock::now() - std::chrono::hours(10000);
  }

  TestDevice device_;
};

class DeviceRegistry final : public AppRegistrySubject {
 public:
  platform::AppRegistry& registry() override { return device_.registry(); }
  platform::UninstalledAppsList& uninstalledApps() override { return device_.services().uninstalledApps(); }

  std::optional<std::string> deviceBoundLicence() override {
    return "<plist><dict><key>DeviceIdentifier</key><string>this one</string></dict></plist>";
  }
  platform::FileLocation makePackage(std::string_view identifier, std::string_view version) override {
    return device_.stage(newName(), appPackage(identifier, version));
  }
  platform::FileLocation makeDamagedPackage(std::string_view identifier) override {
    std::string package = appPackage(identifier);
    package.resize(package.size() / 2);
    return device_.stage(newName(), package);
  }
  platform::FileLocation makePlaceholderFolder(std::string_view identifier, std::string_view version) override {
    const std::string folder = std::string(kFolder).append("/").append(newName()).append("/Placeholder.app");
    putFile(device_, folder + "/Info.plist", infoPlist(identifier, version));
    return {folder, true};
  }
  void removeLocation(const platform::FileLocation& location) override {
    std::filesystem::remove_all(device_.host(location.path));
  }
  std::string fingerprint(const platform::FileLocation& location) override {
    const std::string path = device_.host(location.path);
    if (!location.isDirectory) return readHostFile(path);
    return readHostFile(path + "/Info.plist") + std::to_string(TestDevice::entriesIn(path));
  }

  bool isUsable(std::string_view bundlePath) override {
    return std::filesystem::exists(device_.host(bundlePath) + "/Info.plist");
  }
  void changeInstallOrder() override { device_.placeholder("com.first" + newName()); }
  bool addSystemApp(std::string_view identifier) override {
    return device_.registry()
        .installSystemApplication(makePackage(identifier, "1.0"), TestDevice::customer(identifier))
        .ok();
  }
  std::optional<std::string> storeMetadataOf(std::string_view identifier) override {
    return readHostFile(device_.host(*device_.record(identifier)->bundleContainerPath()) + "/HarvoMetadata.plist");
  }
  std::optional<std::string> licenceDataOf(std::string_view identifier) override {
    const auto licence = device_.registry().licenceData(identifier);
    if (!licence || !*licence) return "(none)";
    return std::string(textOf(**licence));
  }
  bool restart() override {
    device_.reopen();
    return true;
  }

 private:
  std::string newName() { return std::to_string(++made_); }

  TestDevice device_;
  int made_ = 0;
};

class DeviceUninstalledApps final : public UninstalledAppsListSubject {
 public:
  platform::UninstalledAppsList& list() override { return device_.services().uninstalledApps(); }
  void removeRealApp(std::string_view identifier) override {
    installApp(identifier);
    ASSERT_TRUE(device_.registry().uninstallApplication(identifier).ok());
  }
  void installApp(std::string_view identifier) override { device_.install(identifier); }
  bool restart() override {
    device_.reopen();
    return true;
  }

 private:
  TestDevice device_;
};

class DeviceTime final : public TimeSubject {
 public:
  Clock& clock() override { return device_.services().clock(); }
  Scheduler& scheduler() override { return device_.services().scheduler(); }
  void pass(Duration) override {}

 private:
  TestDevice device_;
};

}  // namespace

INSTANTIATE_TEST_SUITE_P(Device, FileSystemContract,
                         testing::Values(implementation<FileSystemSubject, DeviceFiles>("Device")), implementationName);
INSTANTIATE_TEST_SUITE_P(Device, AppRegistryContract,
                         testing::Values(implementation<AppRegistrySubject, DeviceRegistry>("Device")),
                         implementationName);
INSTANTIATE_TEST_SUITE_P(Device, UninstalledAppsListContract,
                         testing::Values(implementation<UninstalledAppsListSubject, DeviceUninstalledApps>("Device")),
                         implementationName);
INSTANTIATE_TEST_SUITE_P(Device, TimeContract, testing::Values(implementation<TimeSubject, DeviceTime>("Device")),
                         implementationName);

}  // namespace appsync::test
