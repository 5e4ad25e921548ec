// A device of its own for a test.
#pragma once

#include <filesystem>
#include <fstream>
#include <iterator>
#include <memory>
#include <string>
#include <string_view>
#include <utility>

#include <gtest/gtest.h>

#include "device/Device.h"
#include "kit/fakes/TemporaryFolder.h"
#include "tests/support/ZipArchive.h"

namespace appsync::test {

inline void writeHostFile(const std::string& path, std::string_view content) {
  std::ofstream file(path, std::ios::binary);
  file << content;
}

[[nodiscard]] inline std::string readHostFile(const std::string& path) {
  std::ifstream file(path, std::ios::binary);
  return {std::istreambuf_iterator<char>(file), {}};
}

class TestDevice {
 public:
  explicit TestDevice(device::InstallMode mode = device::InstallMode::direct)
      : device_(made(device::Device::create(path(), mode))) {}
  /// A copy of a device that nobody holds.
  explicit TestDevice(const std::string& original) {
    std::filesystem::copy(original, path(), std::filesystem::copy_options::recursive);
  }

  [[nodiscard]] device::Services& services() { return device_->services(); }
  [[nodiscard]] device::AppRegistry& registry() { return services().defaultRegistry(); }
  [[nodiscard]] device::DeviceFileSystem& files() { return services().fileSystem(); }

  [[nodiscard]] std::string path() const { return folder_.path("device"); }
  /// Where a device path lies on this machine.
  [[nodiscard]] std::string host(std::string_view devicePath) const {
    return path() + "/root" + std::string(devicePath);
  }

  void close() { device_.reset(); }
  void reopen() {
    close();
    device_ = made(device::Device::open(path(), device::Access::exclusive));
  }

  /// Puts a package where the host would, and gives its location.
  platform::FileLocation stage(std::string_view name, std::string_view package) {
    const std::string devicePath = "/var/mobile/Media/PublicStaging/" + std::string(name);
    writeHostFile(host(devicePath), package);
    return *platform::FileLocation::file(devicePath);
  }

  /// Puts a placeholder's folder into the temporary directory.
  platform::FileLocation stagePlaceholder(std::string_view identifier, std::string_view version = "1.0") {
    const std::string devicePath = "/tmp/" + std::string(identifier) + ".app";
    std::filesystem::create_directories(host(devicePath));
    writeHostFile(host(devicePath) + "/Info.plist", infoPlist(identifier, version));
    writeHostFile(host(devicePath) + "/Icon.png", "a picture");
    return *platform::FileLocation::directory(devicePath);
  }

  [[nodiscard]] Status tryInstall(std::string_view identifier, std::string_view package) {
    return registry().installApplication(stage("package.zip", package), customer(identifier));
  }
  void install(std::string_view identifier, std::string_view version = "1.0") {
    const Status installed = tryInstall(identifier, appPackage(identifier, version));
    ASSERT_TRUE(installed.ok()) << installed.error().text;
  }
  void placeholder(std::string_view identifier, platform::TSInstallType type = platform::TSInstallType::Sync) {
    const Status installed =
        registry().installApplication(stagePlaceholder(identifier), placeholderOptions(identifier, type));
    ASSERT_TRUE(installed.ok()) << installed.error().text;
  }

  [[nodiscard]] static plist::Dictionary customer(std::string_view identifier) {
    return {{platform::PackageTypeKey, platform::kPackageTypeCustomer}, {platform::BundleIdentifierKey, identifier}};
  }
  [[nodiscard]] static plist::Dictionary placeholderOptions(
      std::string_view identifier, platform::TSInstallType type = platform::TSInstallType::Sync) {
    return {{platform::PackageTypeKey, platform::PackageTypePlaceholder},
            {platform::BundleIdentifierKey, identifier},
            {platform::kInstallTypeKey, static_cast<std::uint64_t>(type)}};
  }

  [[nodiscard]] std::shared_ptr<const platform::AppRecord> record(std::string_view identifier) {
    return registry().recordForIdentifier(identifier, platform::PlaceholderLookup::on);
  }

  /// How many entries a folder of the host has.
  [[nodiscard]] static std::ptrdiff_t entriesIn(const std::string& folder) {
    return std::distance(std::filesystem::directory_iterator(folder), {});
  }
  [[nodiscard]] std::ptrdiff_t containers() const { return entriesIn(host(device::kContainersPath)); }
  /// Whether nothing half done lies about.
  [[nodiscard]] bool isTidy() const { return entriesIn(path() + "/work") == 0; }

 private:
  static std::unique_ptr<device::Device> made(Result<std::unique_ptr<device::Device>> opened) {
    if (!opened) throw std::runtime_error(opened.error().text);
    return std::move(opened).value();
  }

  TemporaryFolder folder_;
  std::unique_ptr<device::Device> device_;
};

}  // namespace appsync::test
