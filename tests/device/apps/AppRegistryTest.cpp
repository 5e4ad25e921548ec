// Behaviour of the device that the registry contract leaves open.
#include <algorithm>
#include <cerrno>
#include <filesystem>
#include <functional>
#include <optional>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "device/packages/InstallerError.h"
#include "kit/fakes/Threads.h"
#include "tests/device/InjectedFault.h"
#include "tests/device/apps/AppRegistryFixture.h"

namespace appsync::test {

using device::InstallerFailure;
using platform::AppRecords;
using platform::BundleKind;
using platform::TSInstallPhase;
using platform::TSInstallState;
using platform::TSInstallType;

namespace {

namespace fs = std::filesystem;

std::vector<std::string> passed;
int recordFaultPoint(const char* name) {
  passed.emplace_back(name);
  return 0;
}

/// Returns the fault points of `work` that move directories, once for several in a row, or make earlier changes
/// durable.
std::vector<std::string> durableFaultPointsOf(const std::function<void()>& work) {
  passed.clear();
  withFaultHook(recordFaultPoint, work);
  std::erase_if(
      passed, [](const std::string& name) { return name != "rename" && name != "sync" && name != "database to disk"; });
  passed.erase(std::unique(passed.begin(), passed.end()), passed.end());
  return passed;
}

using FaultPoints = std::vector<std::string>;

}  // namespace

// Options.

TEST_F(AppRegistryTest, NamesInvalidOption) {
  const auto package = device_.stage("a.zip", appPackage("com.a"));
  const auto install = [&](const plist::Dictionary& options) {
    return registry().installApplication(package, options);
  };
  expectFailure(install({}), InstallerFailure::badOptions,
                "the install option \"PackageType\" must be \"Customer\" or \"Placeholder\"");
  plist::Dictionary options = TestDevice::customer("com.a");
  options.erase(platform::BundleIdentifierKey);
  expectFailure(install(options), InstallerFailure::badOptions,
                "the install option \"BundleIdentifier\" must name the app");
  expectFailure(
      install(TestDevice::customer("com/a")), InstallerFailure::badIdentifier,
      "\"com/a\" is not a bundle identifier: it may have only letters, digits, '-', '.' and '_', at most 200 and no dot first");
  options = TestDevice::customer("com.a");
  options.set(platform::kInstallTypeKey, "4");
  expectFailure(install(options), InstallerFailure::badOptions,
                "the install option \"TSInstallType\" must be a number");
  options = TestDevice::customer("com.a");
  options.set(platform::kLicenceDataKey, "text");
  expectFailure(install(options), InstallerFailure::badOptions, "the install option \"LicenceData\" must be data");
  EXPECT_EQ(device_.record("com.a"), nullptr);
}

TEST_F(AppRegistryTest, NamesAppOfOtherPackage) {
  expectFailure(device_.tryInstall("com.b", appPackage("com.a")), InstallerFailure::identifierMismatch,
                "this is the app \"com.a\" and not \"com.b\"; ask for the one it is");
}

TEST_F(AppRegistryTest, RejectsPackageOutsideDevice) {
  writeHostFile(device_.path() + "/../outside.zip", appPackage("com.a"));
  fs::create_symlink("../../outside.zip", device_.host("/link"));
  for (const char* path : {"/../outside.zip", "/link", "/../../outside.zip"}) {
    EXPECT_EQ(registry().installApplication({path}, TestDevice::customer("com.a")).error().code, EXDEV) << path;
  }
}

TEST_F(AppRegistryTest, RejectsPlaceholderThatIsNotAnAppFolder) {
  fs::create_directories(device_.host("/tmp/folder"));
  expectFailure(registry().installApplication({"/tmp/folder", true}, TestDevice::placeholderOptions("com.a")),
                InstallerFailure::notAPackage, "a placeholder is a folder \"Name.app\", and \"folder\" is not");
  fs::create_directories(device_.host("/tmp/A.app"));
  expectFailure(registry().installApplication({"/tmp/A.app/", true}, TestDevice::placeholderOptions("com.a")),
                InstallerFailure::noApp,
                "the package's \"A.app\" holds no Info.plist and is no app; add one and pack it again");
  EXPECT_EQ(device_.containers(), 0);
}

// Records.

TEST_F(AppRegistryTest, RecordHasNameSizeAndDate) {
  device_.install("com.a", "2.0");
  const auto apps = registry().apps();
  ASSERT_TRUE(apps.ok());
  ASSERT_EQ(apps->size(), 1U);
  const device::AppRecord& app = *apps->front();
  EXPECT_EQ(app.name(), "Notes");
  EXPECT_EQ(app.staticDiskUsage(), 5000U + 9 + 10 + infoPlist("com.a", "2.0").size());
  EXPECT_GT(app.installedAt().value_or(0), 1.7e9);
  EXPECT_EQ(app.description(), "com.a 2.0 (installed)");
  EXPECT_EQ(fs::path(*app.bundlePath()).filename(), "Notes.app");
}

TEST_F(AppRegistryTest, StoresMetadataNextToBundle) {
  const std::vector<ZipEntry> more{{"HarvoMetadata.plist", "packed"}, {"HarvoArtwork", "art"}};
  ASSERT_TRUE(device_.tryInstall("com.a", appPackage("com.a", "1.0", more)).ok());
  EXPECT_EQ(inContainer("com.a", "HarvoMetadata.plist"), "packed");
  EXPECT_EQ(inContainer("com.a", "HarvoArtwork"), "art");
}

TEST_F(AppRegistryTest, StoresMetadataAndLicenceOfOptions) {
  plist::Dictionary options = TestDevice::placeholderOptions("com.a", TSInstallType::Restore);
  options.set(platform::kStoreMetadataKey, plist::Value::data(bytesOf("given")));
  options.set(platform::kLicenceDataKey, plist::Value::data(bytesOf("licence")));
  ASSERT_TRUE(registry().installApplication(device_.stagePlaceholder("com.a"), options).ok());
  EXPECT_EQ(inContainer("com.a", "HarvoMetadata.plist"), "given");
  const auto licence = registry().licenceData("com.a");
  ASSERT_TRUE(licence.ok() && *licence);
  EXPECT_EQ(textOf(**licence), "licence");
  device_.install("com.a");
  EXPECT_EQ(textOf(registry().licenceData("com.a")->value_or(Bytes())), "licence");
  EXPECT_EQ(device_.record("com.a")->installType(), TSInstallType::Restore);
}

TEST_F(AppRegistryTest, PrefersMetadataOfOptions) {
  plist::Dictionary options = TestDevice::customer("com.a");
  options.set(platform::kStoreMetadataKey, plist::Value::data(bytesOf("given")));
  const auto package = device_.stage("a.zip", appPackage("com.a", "1.0", {{"HarvoMetadata.plist", "packed"}}));
  ASSERT_TRUE(registry().installApplication(package, options).ok());
  EXPECT_EQ(inContainer("com.a", "HarvoMetadata.plist"), "given");
}

TEST_F(AppRegistryTest, EnumeratesInOrderOfInstallation) {
  for (const char* identifier : {"com.c", "com.a", "com.b"})
    device_.install(identifier);
  device_.install("com.c", "2.0");
  EXPECT_EQ(walk(BundleKind::all), (Identifiers{"com.c", "com.a", "com.b"}));
}

TEST_F(AppRegistryTest, SeparatesSystemApps) {
  device_.install("com.user");
  ASSERT_TRUE(registry()
                  .installSystemApplication(device_.stagePlaceholder("com.system"),
                                            TestDevice::placeholderOptions("com.system", TSInstallType::Downgrade))
                  .ok());
  EXPECT_EQ(walk(BundleKind::system), Identifiers{"com.system"});
  EXPECT_EQ(walk(BundleKind::user), Identifiers{"com.user"});
  device_.install("com.system");
  EXPECT_EQ(device_.record("com.system")->applicationType(), platform::kApplicationTypeSystem);
  EXPECT_EQ(walk(BundleKind::system), Identifiers{"com.system"});
}

// Containers.

TEST_F(AppRegistryTest, UpdateReplacesContainer) {
  device_.install("com.a", "1.0");
  const std::string before = *device_.record("com.a")->bundleContainerPath();
  device_.install("com.a", "2.0");
  EXPECT_NE(device_.record("com.a")->bundleContainerPath(), before);
  EXPECT_EQ(device_.containers(), 1);
  EXPECT_TRUE(device_.isTidy());
}

TEST_F(AppRegistryTest, UpdateIsDurableBeforeOldVersionIsRemoved) {
  plist::Dictionary options = TestDevice::customer("com.a");
  options.set(platform::kInstallTypeKey, static_cast<std::uint64_t>(TSInstallType::Sync));
  const auto install = [&](std::string_view version) {
    const auto package = device_.stage("package.zip", appPackage("com.a", version));
    return durableFaultPointsOf([&] { EXPECT_TRUE(registry().installApplication(package, options).ok()); });
  };
  EXPECT_EQ(install("1.0"), (FaultPoints{"rename", "sync"}));
  EXPECT_EQ(install("2.0"), (FaultPoints{"rename", "sync", "database to disk", "rename"}));
}

TEST_F(AppRegistryTest, SyncPlaceholderIsReplacedWithoutDiskSync) {
  device_.placeholder("com.a");
  const auto package = device_.stage("package.zip", appPackage("com.a"));
  EXPECT_EQ(durableFaultPointsOf(
                [&] { EXPECT_TRUE(registry().installApplication(package, TestDevice::customer("com.a")).ok()); }),
            (FaultPoints{"rename", "sync", "rename"}));
  device_.placeholder("com.b", TSInstallType::Restore);
  const auto restored = device_.stage("restored.zip", appPackage("com.b"));
  EXPECT_EQ(durableFaultPointsOf(
                [&] { EXPECT_TRUE(registry().installApplication(restored, TestDevice::customer("com.b")).ok()); }),
            (FaultPoints{"rename", "sync", "database to disk", "rename"}));
}

TEST_F(AppRegistryTest, RemovalIsDurableBeforeFilesAreRemoved) {
  device_.install("com.a");
  EXPECT_EQ(durableFaultPointsOf([&] { EXPECT_TRUE(registry().uninstallApplication("com.a").ok()); }),
            (FaultPoints{"database to disk", "rename"}));
}

TEST_F(AppRegistryTest, UnreadableRegistryIsAnError) {
  device_.install("com.a");
  {
    device::Database::Session session(device_.services().database());
    ASSERT_TRUE(session.runScript("alter table bundles rename to lost").ok());
  }
  const std::string text = "database: no such table: bundles";
  EXPECT_EQ(device_.tryInstall("com.a", appPackage("com.a", "2.0")).error().text, text);
  EXPECT_EQ(registry().uninstallApplication("com.a").error().text, text);
  EXPECT_EQ(registry().demote("com.a", TSInstallType::Downgrade).error().text, text);
  EXPECT_EQ(registry().setPlaceholderType("com.a", TSInstallType::Downgrade).error().text, text);
  EXPECT_EQ(registry().renamePlaceholder("com.a", "Other").error().text, text);
  EXPECT_EQ(device_.containers(), 1);
}

TEST_F(AppRegistryTest, PlaceholderHasItsOwnContainer) {
  device_.install("com.a", "1.0");
  const std::string before = *device_.record("com.a")->bundleContainerPath();
  device_.placeholder("com.a");
  EXPECT_EQ(device_.record("com.a")->bundleContainerPath(), before);
  EXPECT_EQ(device_.containers(), 2);
  device_.install("com.a", "2.0");
  EXPECT_EQ(device_.containers(), 1);
}

TEST_F(AppRegistryTest, RemovalRemovesContainers) {
  device_.install("com.a");
  device_.placeholder("com.a");
  ASSERT_TRUE(registry().uninstallApplication("com.a").ok());
  EXPECT_EQ(device_.containers(), 1);
  ASSERT_TRUE(registry().uninstallApplication("com.a").ok());
  EXPECT_EQ(device_.containers(), 0);
  EXPECT_TRUE(device_.isTidy());
  expectFailure(registry().uninstallApplication("com.a"), InstallerFailure::unknownApp,
                "there is no app \"com.a\" to remove");
}

TEST_F(AppRegistryTest, LeavesNoTraceAfterAnyFault) {
  device_.install("com.a", "1.0");
  const auto package = device_.stage("b.zip", appPackage("com.a", "2.0"));
  for (long faultPoint = 1;; ++faultPoint) {
    std::optional<InjectedFault> fault(faultPoint);
    const Status installed = registry().installApplication(package, TestDevice::customer("com.a"));
    fault.reset();
    if (installed) break;
    EXPECT_EQ(installed.error().domain, domains::kPOSIX) << installed.error().text;
    EXPECT_EQ(installed.error().code, ENOSPC) << installed.error().text;
    EXPECT_EQ(registry().lastInstallFailure("com.a"), installed.error());
    EXPECT_EQ(device_.record("com.a")->bundleVersion(), "1.0") << faultPoint;
    EXPECT_EQ(device_.record("com.a")->installProgress(), nullptr) << faultPoint;
    EXPECT_EQ(device_.containers(), 1) << faultPoint;
    EXPECT_TRUE(device_.isTidy()) << faultPoint;
    ASSERT_FALSE(HasFailure());
  }
  device_.install("com.a", "3.0");
  EXPECT_EQ(registry().lastInstallFailure("com.a"), std::nullopt);
  device_.reopen();
  EXPECT_EQ(device_.record("com.a")->bundleVersion(), "3.0");
  EXPECT_EQ(device_.containers(), 1);
}

TEST_F(AppRegistryTest, ConcurrentInstallsAndRemovalsAreSafe) {
  constexpr std::size_t kThreads = 10;
  for (std::size_t index = 0; index < kThreads; ++index) {
    device_.stage(std::to_string(index), appPackage("com.a" + std::to_string(index)));
  }
  runOnThreads(kThreads, [&](std::size_t index) {
    const std::string identifier = "com.a" + std::to_string(index);
    const platform::FileLocation package{"/var/mobile/Media/PublicStaging/" + std::to_string(index)};
    for (int round = 0; round < 3; ++round) {
      EXPECT_TRUE(registry().installApplication(package, TestDevice::customer(identifier)).ok());
      if (index % 2 == 0) {
        EXPECT_TRUE(registry().uninstallApplication(identifier).ok());
      }
    }
  });
  EXPECT_EQ(walk(BundleKind::all).size(), 5U);
  EXPECT_EQ(device_.containers(), 5);
  EXPECT_EQ(device_.services().uninstalledApps().lookupUninstalled()->size(), 5U);
  EXPECT_TRUE(device_.isTidy());
}

// Progress.

TEST_F(AppRegistryTest, InstallOfPlaceholderWaitsInitially) {
  device_.placeholder("com.a");
  ASSERT_NE(progress("com.a"), nullptr);
  EXPECT_EQ(progress("com.a")->installState(), TSInstallState::Waiting);
  EXPECT_EQ(progress("com.a")->installPhase(), TSInstallPhase::Loading);
  EXPECT_EQ(progress("com.a")->completedUnitCount(), 0);
  EXPECT_EQ(progress("com.a")->description(), "com.a: TSInstallState 0, TSInstallPhase 0, 0 of 1000");
}

TEST_F(AppRegistryTest, ProgressEndsFinished) {
  device_.placeholder("com.a");
  const auto watched = progress("com.a");
  device_.install("com.a");
  EXPECT_EQ(watched->installState(), TSInstallState::Finished);
  EXPECT_EQ(watched->installPhase(), TSInstallPhase::Installing);
}

TEST_F(AppRegistryTest, FailedInstallOfPlaceholderStaysFailed) {
  device_.placeholder("com.a");
  EXPECT_FALSE(device_.tryInstall("com.a", "no package").ok());
  ASSERT_NE(progress("com.a"), nullptr);
  EXPECT_EQ(progress("com.a")->installState(), TSInstallState::Failed);
}

TEST_F(AppRegistryTest, RemovedPlaceholderCancelsInstall) {
  device_.placeholder("com.a");
  const auto watched = progress("com.a");
  ASSERT_TRUE(registry().uninstallApplication("com.a").ok());
  EXPECT_EQ(watched->installState(), TSInstallState::Canceled);
}

TEST_F(AppRegistryTest, CancelledInstallIsNotRunning) {
  device_.placeholder("com.a");
  const auto watched = progress("com.a");
  watched->cancel();
  EXPECT_EQ(progress("com.a"), nullptr);
  EXPECT_NE(device_.record("com.a"), nullptr);
  watched->setInstallState(TSInstallState::Active);
  EXPECT_EQ(watched->installState(), TSInstallState::Canceled);
  device_.install("com.a");
  EXPECT_TRUE(device_.record("com.a")->isInstalled());
}

TEST_F(AppRegistryTest, IgnoresPhaseEndOfOldProgress) {
  device_.placeholder("com.a");
  const auto old = progress("com.a");
  ASSERT_TRUE(registry().uninstallApplication("com.a").ok());
  device_.placeholder("com.a");
  registry().installPhaseFinishedForProgress(*old);
  EXPECT_EQ(progress("com.a")->installPhase(), TSInstallPhase::Loading);
}

}  // namespace appsync::test
