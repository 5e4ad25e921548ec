// Recovery at the opening of a device, and crashes at every fault point of every operation.
#include <filesystem>
#include <string>

#include <gtest/gtest.h>
#include <unistd.h>

#include "device/Recovery.h"
#include "tests/support/KilledDevice.h"

namespace appsync::test {

using device::Device;
using platform::TSInstallPhase;
using platform::TSInstallState;
using platform::TSInstallType;

namespace fs = std::filesystem;

// Recovery.

TEST(Recovery, RemovesIncompleteFiles) {
  TestDevice device;
  device.install("com.a");
  device.close();
  fs::create_directories(device.host(device::kContainersPath) + "/1234.tmp/Half.app/deep");
  fs::create_directories(device.host(device::kContainersPath) + "/WITHOUT-RECORD/Whole.app");
  writeHostFile(device.host(device::kContainersPath) + "/file", "x");
  fs::create_directories(device.path() + "/work/a/b/c");
  writeHostFile(device.path() + "/work/a/b/file", "x");
  fs::create_directories(device.host("/tmp/com.corvel.zeph.Apps/com.b.app"));
  device.reopen();
  EXPECT_EQ(device.containers(), 1);
  EXPECT_TRUE(device.isTidy());
  EXPECT_EQ(TestDevice::entriesIn(device.host("/tmp")), 0);
  EXPECT_EQ(versionOf(device, "com.a"), "1.0");
}

TEST(Recovery, RemovesRecordsOfMissingContainers) {
  TestDevice device;
  device.install("com.a");
  device.install("com.b");
  fs::remove_all(device.host(*device.record("com.a")->bundleContainerPath()));
  device.reopen();
  EXPECT_EQ(device.record("com.a"), nullptr);
  EXPECT_EQ(versionOf(device, "com.b"), "1.0");
  EXPECT_TRUE(device.services().uninstalledApps().lookupUninstalled()->empty());
}

TEST(Recovery, RemovesPlaceholdersOfSyncs) {
  TestDevice device;
  device.placeholder("com.a");
  device.reopen();
  EXPECT_EQ(device.record("com.a"), nullptr);
  EXPECT_EQ(device.containers(), 0);
}

TEST(Recovery, KeepsAppUnderPlaceholderOfSync) {
  TestDevice device;
  device.install("com.a", "1.5");
  device.placeholder("com.a");
  ASSERT_TRUE(device.record("com.a")->isPlaceholder());
  device.reopen();
  EXPECT_EQ(versionOf(device, "com.a"), "1.5");
  EXPECT_EQ(device.record("com.a")->installProgress(), nullptr);
  EXPECT_EQ(device.containers(), 1);
}

TEST(Recovery, KeepsOtherPlaceholdersWithWaitingInstalls) {
  TestDevice device;
  device.placeholder("com.a", TSInstallType::Restore);
  const auto before = device.record("com.a")->installProgress();
  before->setCompletedUnitCount(400);
  before->setInstallPhase(TSInstallPhase::Installing);
  before->setInstallState(TSInstallState::Active);
  device.reopen();
  EXPECT_EQ(versionOf(device, "com.a"), "1.0 placeholder");
  EXPECT_EQ(device.record("com.a")->installType(), TSInstallType::Restore);
  const auto progress = device.record("com.a")->installProgress();
  ASSERT_NE(progress, nullptr);
  EXPECT_EQ(progress->installState(), TSInstallState::Waiting);
  EXPECT_EQ(progress->installPhase(), TSInstallPhase::Loading);
  EXPECT_EQ(progress->completedUnitCount(), 0);
  progress->setInstallState(TSInstallState::Active);
  EXPECT_EQ(device.record("com.a")->installProgress()->installState(), TSInstallState::Active);
}

TEST(Recovery, KeepsPausedRestoreUnchanged) {
  TestDevice device;
  device.placeholder("com.a", TSInstallType::Restore);
  const auto before = device.record("com.a")->installProgress();
  before->setCompletedUnitCount(400);
  before->setInstallPhase(TSInstallPhase::RestoringData);
  device.reopen();
  const auto progress = device.record("com.a")->installProgress();
  ASSERT_NE(progress, nullptr);
  EXPECT_EQ(progress->installPhase(), TSInstallPhase::RestoringData);
  EXPECT_EQ(progress->completedUnitCount(), 400);
}

TEST(Recovery, IsIdempotent) {
  TestDevice device;
  device.install("com.a");
  device.placeholder("com.b", TSInstallType::Restore);
  device.reopen();
  const std::string container = *device.record("com.a")->bundleContainerPath();
  device.reopen();
  EXPECT_EQ(device.record("com.a")->bundleContainerPath(), container);
  EXPECT_EQ(versionOf(device, "com.b"), "1.0 placeholder");
}

// Crashes.

TEST(KilledDevice, CreationCanBeRepeatedAfterCrash) {
  long step = 1;
  for (bool goOn = true; goOn; ++step) {
    TemporaryFolder folder;
    goOn = killedAt(step, [&] {
      if (!Device::create(folder.path("device"))) _exit(1);
    });
    const auto opened = Device::open(folder.path("device"), device::Access::exclusive);
    if (opened) continue;
    const auto made = Device::create(folder.path("device"));
    ASSERT_TRUE(made.ok()) << "step " << step << ": " << made.error().text;
  }
  EXPECT_GT(step, 10);
}

TEST(KilledDevice, InstallIsAtomic) {
  killAtEveryStep(
      [](TestDevice& device) { device.stage("a.zip", appPackage("com.a", "2.0")); },
      [](TestDevice& device) {
        auto& registry = device.services().defaultRegistry();
        if (!registry.installApplication({"/var/mobile/Media/PublicStaging/a.zip"}, TestDevice::customer("com.a")))
          _exit(2);
      },
      [](TestDevice& device) {
        const std::string version = versionOf(device, "com.a");
        EXPECT_TRUE(version == "none" || version == "2.0") << version;
        device.install("com.a", "3.0");
        EXPECT_EQ(versionOf(device, "com.a"), "3.0");
      });
}

TEST(KilledDevice, UpdateIsAtomic) {
  killAtEveryStep(
      [](TestDevice& device) {
        device.install("com.a", "1.0");
        device.placeholder("com.a", TSInstallType::Restore);
        device.stage("a.zip", appPackage("com.a", "2.0"));
      },
      [](TestDevice& device) {
        auto& registry = device.services().defaultRegistry();
        if (!registry.installApplication({"/var/mobile/Media/PublicStaging/a.zip"}, TestDevice::customer("com.a")))
          _exit(2);
      },
      [](TestDevice& device) {
        const std::string version = versionOf(device, "com.a");
        EXPECT_TRUE(version == "1.0 placeholder" || version == "2.0") << version;
        ASSERT_TRUE(device.registry().uninstallApplication("com.a").ok());
      });
}

TEST(KilledDevice, PlaceholderIsAtomic) {
  killAtEveryStep([](TestDevice&) {},
                  [](TestDevice& device) {
                    auto& services = device.services();
                    const std::string folder = "/tmp/com.a.app";
                    if (!services.fileSystem().createDirectory(folder, platform::IntermediateDirectories::create, {}))
                      _exit(3);
                    const std::string info = infoPlist("com.a");
                    if (!services.fileSystem().writeFileAtomically(folder + "/Info.plist", bytesOf(info))) _exit(4);
                    if (!services.defaultRegistry().installApplication(
                            {folder, true}, TestDevice::placeholderOptions("com.a", TSInstallType::Restore)))
                      _exit(2);
                  },
                  [](TestDevice& device) {
                    const std::string version = versionOf(device, "com.a");
                    EXPECT_TRUE(version == "none" || version == "1.0 placeholder") << version;
                  });
}

TEST(KilledDevice, RemovalIsAtomic) {
  killAtEveryStep([](TestDevice& device) { device.install("com.a"); },
                  [](TestDevice& device) {
                    if (!device.services().defaultRegistry().uninstallApplication("com.a")) _exit(2);
                  },
                  [](TestDevice& device) {
                    const bool isRemoved = device.services().uninstalledApps().lookupUninstalled()->contains("com.a");
                    EXPECT_EQ(versionOf(device, "com.a"), isRemoved ? "none" : "1.0");
                  });
}

TEST(KilledDevice, RecoveryIsCrashSafe) {
  killAtEveryStep(
      [](TestDevice& device) {
        device.install("com.a");
        device.placeholder("com.a");
        device.placeholder("com.b", TSInstallType::Restore);
        device.placeholder("com.c");
        fs::create_directories(device.host(device::kContainersPath) + "/stray/Half.app/deep");
        fs::create_directories(device.path() + "/work/x/y");
        writeHostFile(device.path() + "/work/x/y/z", "1");
      },
      [](TestDevice&) {},
      [](TestDevice& device) {
        EXPECT_EQ(versionOf(device, "com.a"), "1.0");
        EXPECT_EQ(versionOf(device, "com.b"), "1.0 placeholder");
        EXPECT_EQ(versionOf(device, "com.c"), "none");
      });
}

TEST(KilledDevice, FileReplacementIsAtomic) {
  killAtEveryStep([](TestDevice& device) { writeHostFile(device.host("/var/mobile/file"), "old"); },
                  [](TestDevice& device) {
                    auto& files = device.services().fileSystem();
                    if (!files.writeFileAtomically("/var/mobile/file", bytesOf("new"))) _exit(2);
                    if (!files.createDirectory("/var/mobile/a/b", platform::IntermediateDirectories::create, {}))
                      _exit(2);
                    if (!files.copyItem("/var/mobile/file", "/var/mobile/a/b/copy")) _exit(2);
                    if (!files.copyItem("/var/mobile/a", "/var/mobile/c")) _exit(2);
                    if (!files.moveItem("/var/mobile/c", "/var/mobile/d")) _exit(2);
                    if (!files.removeItem("/var/mobile/a")) _exit(2);
                  },
                  [](TestDevice& device) {
                    const std::string content = readHostFile(device.host("/var/mobile/file"));
                    EXPECT_TRUE(content == "old" || content == "new") << content;
                    for (const char* path : {"/var/mobile/a/b/copy", "/var/mobile/c/b/copy", "/var/mobile/d/b/copy"}) {
                      if (fs::exists(device.host(path))) {
                        EXPECT_EQ(readHostFile(device.host(path)), "new");
                      }
                    }
                    for (const char* path : {"/var/mobile/c", "/var/mobile/d"}) {
                      EXPECT_EQ(fs::exists(device.host(path)), fs::exists(device.host(path) + "/b/copy"));
                    }
                  });
}

}  // namespace appsync::test
