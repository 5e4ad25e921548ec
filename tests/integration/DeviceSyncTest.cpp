// Syncs of an embedded device, with real registry, installer and files.
#include <filesystem>
#include <map>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "tests/integration/DeviceSync.h"

namespace appsync::test {
namespace {

using Package = HostApp::Package;
using Strings = std::vector<std::string>;

/// An app as the user sees it.
struct Seen {
  std::string version;
  bool isInstalled = false;
  bool isPlaceholder = false;
  bool operator==(const Seen&) const = default;
};
std::ostream& operator<<(std::ostream& out, const Seen& seen) {
  return out << seen.version << (seen.isInstalled ? " installed" : "") << (seen.isPlaceholder ? " placeholder" : "");
}

class DeviceSyncTest : public testing::TestWithParam<device::InstallMode> {
 protected:
  [[nodiscard]] std::map<std::string, Seen> appsOnDevice() {
    std::map<std::string, Seen> apps;
    device.registry().enumerateBundlesOfType(
        platform::BundleKind::all, [&](const platform::BundleRecord& bundle, bool&) {
          const platform::AppRecord* app = bundle.asAppRecord();
          if (app == nullptr) return;
          apps[app->applicationIdentifier()] = {app->bundleVersion().value_or(""), app->isInstalled(),
                                                app->isPlaceholder()};
          if (!app->isInstalled()) return;
          const std::string bundleFolder = device.host(app->bundlePath().value_or(""));
          EXPECT_EQ(std::filesystem::file_size(bundleFolder + "/data/deep/file"), 5000U) << bundleFolder;
        });
    return apps;
  }

  /// Checks that the sync left no temporary files.
  void expectTidy(std::size_t installed) {
    EXPECT_TRUE(device.isTidy());
    EXPECT_EQ(device.containers(), static_cast<std::ptrdiff_t>(installed));
    EXPECT_EQ(device.entriesIn(device.host("/var/mobile/Media/PublicStaging")), 0) << "packages are left behind";
    EXPECT_FALSE(std::filesystem::exists(device.host("/var/mobile/Library/ApplicationSync/RestoreState.plist")));
  }

  static std::string name(std::size_t number) { return "com.app" + std::to_string(number); }

  TestDevice device{GetParam()};
  DeviceSync sync{device};
};

INSTANTIATE_TEST_SUITE_P(Modes, DeviceSyncTest,
                         testing::Values(device::InstallMode::direct, device::InstallMode::coordinated),
                         [](const auto& mode) {
                           return mode.param == device::InstallMode::direct ? "direct" : "coordinated";
                         });

TEST_P(DeviceSyncTest, SyncInstallsUpdatesRemovesAndFailsAsExpected) {
  for (const char* identifier : {"com.gone", "com.keep", "com.app0", "com.app1"})
    device.install(identifier, "1.0");
  std::filesystem::remove(device.host("/var/mobile/Media/PublicStaging/package.zip"));
  std::vector<HostApp> apps;
  std::map<std::string, Seen> expected{{"com.keep", {"1.0", true, false}}};
  std::map<std::string, std::string> words{{"com.gone", "remove"}};
  for (std::size_t number = 0; number < 28; ++number) {
    apps.push_back({name(number), "2.0"});
    expected[name(number)] = {"2.0", true, false};
    words[name(number)] = "INSTALLED";
  }
  apps.push_back({"com.damaged", "2.0", Package::damaged});
  apps.push_back({"com.lost", "2.0", Package::lost});
  words["com.damaged"] = "FAILED";
  words["com.lost"] = "install";

  EXPECT_EQ(sync.run(apps, {"com.gone"}).size(), 30U);
  EXPECT_EQ(appsOnDevice(), expected);
  EXPECT_EQ(sync.todoOperations(), words);
  expectTidy(29);

  device.reopen();
  EXPECT_EQ(appsOnDevice(), expected);
  expectTidy(29);
}

TEST_P(DeviceSyncTest, NextSyncRetriesFailedApps) {
  sync.run({{"com.damaged", "2.0", Package::damaged}, {"com.lost", "2.0", Package::lost}, {"com.a", "2.0"}}, {});
  EXPECT_EQ(appsOnDevice(), (std::map<std::string, Seen>{{"com.a", {"2.0", true, false}}}));
  device.reopen();
  EXPECT_EQ(sync.run({{"com.damaged", "2.0"}, {"com.lost", "2.0"}}, {"com.a"}), (Strings{"com.damaged", "com.lost"}));
  EXPECT_EQ(appsOnDevice(),
            (std::map<std::string, Seen>{{"com.damaged", {"2.0", true, false}}, {"com.lost", {"2.0", true, false}}}));
  expectTidy(2);
}

TEST_P(DeviceSyncTest, ConcurrentInstallsLoseNoTodoListUpdate) {
  std::vector<HostApp> apps;
  std::map<std::string, std::string> words;
  for (std::size_t number = 0; number < 200; ++number) {
    const bool isDamaged = number % 20 == 0;
    apps.push_back({name(number), "1.0", isDamaged ? Package::damaged : Package::good});
    words[name(number)] = isDamaged ? "FAILED" : "INSTALLED";
  }
  EXPECT_EQ(sync.run(apps, {}, 4).size(), 200U);
  EXPECT_EQ(sync.todoOperations(), words);
  EXPECT_EQ(appsOnDevice().size(), 190U);
  expectTidy(190);
}

}  // namespace
}  // namespace appsync::test
