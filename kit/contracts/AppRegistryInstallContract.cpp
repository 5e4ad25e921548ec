// AppRegistryContract: installing and removing.
#include <cstdint>

#include "kit/contracts/AppRegistryContract.h"
#include "kit/fakes/Threads.h"
#include "platform/Keys.h"

namespace appsync::test {

using platform::BundleKind;
using platform::FileLocation;
using platform::PlaceholderLookup;
using platform::TSInstallType;

namespace {

using Identifiers = std::vector<std::string>;

const plist::Dictionary& placeholdersOnly() {
  static const plist::Dictionary options{{platform::kUninstallPlaceholdersOnlyKey, true}};
  return options;
}

bool isInstallersError(const Status& status) {
  return !status &&
         (status.error().domain == platform::kInstallerErrorDomain || status.error().domain == domains::kPOSIX);
}

}  // namespace

TEST_P(AppRegistryContract, InstallsAPackage) {
  install("com.a");
  EXPECT_EQ(stateOf("com.a"), "installed");
}

TEST_P(AppRegistryContract, PackageReplacesEarlierVersion) {
  install("com.a", "1.0");
  install("com.a", "2.0");
  EXPECT_EQ(versionOf("com.a"), "2.0");
  EXPECT_EQ(enumerate(BundleKind::all), Identifiers{"com.a"});
  EXPECT_TRUE(subject().isUsable(*record("com.a")->bundlePath()));
}

TEST_P(AppRegistryContract, PlaceholderIsNotAnInstalledApp) {
  placeholder("com.a", "1.5");
  EXPECT_EQ(stateOf("com.a"), "placeholder");
  EXPECT_EQ(versionOf("com.a"), "1.5");
  EXPECT_EQ(record("com.a")->installType(), TSInstallType::Sync);
}

TEST_P(AppRegistryContract, PlaceholderLeavesInstalledAppUsable) {
  install("com.a", "1.0");
  placeholder("com.a", "2.0");
  EXPECT_EQ(stateOf("com.a"), "both");
  const auto app = registry().recordForIdentifier("com.a", PlaceholderLookup::off);
  ASSERT_NE(app, nullptr);
  ASSERT_TRUE(app->bundlePath());
  EXPECT_TRUE(subject().isUsable(*app->bundlePath()));
}

TEST_P(AppRegistryContract, PackageReplacesPlaceholder) {
  placeholder("com.a");
  install("com.a");
  EXPECT_EQ(stateOf("com.a"), "installed");
}

TEST_P(AppRegistryContract, PackageReplacesAppAndPlaceholder) {
  install("com.a", "1.0");
  placeholder("com.a", "2.0");
  install("com.a", "2.0");
  EXPECT_EQ(stateOf("com.a"), "installed");
  EXPECT_EQ(versionOf("com.a"), "2.0");
}

TEST_P(AppRegistryContract, StoresTheInstallType) {
  plist::Dictionary restoring = options(platform::PackageTypePlaceholder, "com.a");
  restoring.set(platform::kInstallTypeKey, static_cast<std::uint64_t>(TSInstallType::Restore));
  ASSERT_TRUE(registry().installApplication(subject().makePlaceholderFolder("com.a", "1.0"), restoring).ok());
  EXPECT_EQ(record("com.a")->installType(), TSInstallType::Restore);
}

TEST_P(AppRegistryContract, StoresMetadataAndLicence) {
  plist::Dictionary restored = options(platform::kPackageTypeCustomer, "com.a");
  restored.set(platform::kStoreMetadataKey, plist::Value::data(bytesOf("metadata")));
  restored.set(platform::kLicenceDataKey, plist::Value::data(bytesOf("licence")));
  ASSERT_TRUE(registry().installApplication(subject().makePackage("com.a", "1.0"), restored).ok());
  const std::optional<std::string> metadata = subject().storeMetadataOf("com.a");
  const std::optional<std::string> licence = subject().licenceDataOf("com.a");
  if (!metadata && !licence) GTEST_SKIP() << "the subject cannot read metadata or licence";
  EXPECT_EQ(metadata.value_or("metadata"), "metadata");
  EXPECT_EQ(licence.value_or("licence"), "licence");
}

TEST_P(AppRegistryContract, ReportsDeviceBoundLicence) {
  const std::optional<std::string> licence = subject().deviceBoundLicence();
  if (!licence) GTEST_SKIP() << "the subject has no device-bound licences";
  plist::Dictionary restored = options(platform::kPackageTypeCustomer, "com.a");
  restored.set(platform::kLicenceDataKey, plist::Value::data(bytesOf(*licence)));
  ASSERT_TRUE(registry().installApplication(subject().makePackage("com.a", "1.0"), restored).ok());
  install("com.b");
  EXPECT_TRUE(record("com.a")->hasMIDBasedSINF());
  EXPECT_FALSE(record("com.b")->hasMIDBasedSINF());
}

TEST_P(AppRegistryContract, IgnoresNullMetadataAndLicence) {
  plist::Dictionary restored = options(platform::PackageTypePlaceholder, "com.a");
  restored.set(platform::kStoreMetadataKey, nullptr);
  restored.set(platform::kLicenceDataKey, nullptr);
  ASSERT_TRUE(registry().installApplication(subject().makePlaceholderFolder("com.a", "1.0"), restored).ok());
  EXPECT_FALSE(record("com.a")->hasMIDBasedSINF());
}

TEST_P(AppRegistryContract, InstallDoesNotChangeTheLocation) {
  const FileLocation package = subject().makePackage("com.a", "1.0");
  const FileLocation folder = subject().makePlaceholderFolder("com.b", "1.0");
  const std::string before = subject().fingerprint(package) + subject().fingerprint(folder);
  ASSERT_TRUE(tryInstall(package, "com.a").ok());
  ASSERT_TRUE(tryPlaceholder(folder, "com.b").ok());
  EXPECT_EQ(subject().fingerprint(package) + subject().fingerprint(folder), before);
}

TEST_P(AppRegistryContract, LocationIsNeededDuringInstallOnly) {
  const FileLocation package = subject().makePackage("com.a", "1.0");
  const FileLocation folder = subject().makePlaceholderFolder("com.b", "1.0");
  ASSERT_TRUE(tryInstall(package, "com.a").ok());
  ASSERT_TRUE(tryPlaceholder(folder, "com.b").ok());
  subject().removeLocation(package);
  subject().removeLocation(folder);
  EXPECT_EQ(stateOf("com.a"), "installed");
  EXPECT_TRUE(subject().isUsable(*record("com.a")->bundlePath()));
  EXPECT_EQ(stateOf("com.b"), "placeholder");
}

TEST_P(AppRegistryContract, PackageOfAnotherAppFails) {
  EXPECT_TRUE(isInstallersError(tryInstall(subject().makePackage("com.other", "1.0"), "com.a")));
  EXPECT_EQ(enumerate(BundleKind::all), Identifiers());
}

TEST_P(AppRegistryContract, PlaceholderOfAnotherAppFails) {
  EXPECT_TRUE(isInstallersError(tryPlaceholder(subject().makePlaceholderFolder("com.other", "1.0"), "com.a")));
  EXPECT_EQ(enumerate(BundleKind::all), Identifiers());
}

TEST_P(AppRegistryContract, MissingPackageFails) {
  const FileLocation package = subject().makePackage("com.a", "1.0");
  const FileLocation folder = subject().makePlaceholderFolder("com.a", "1.0");
  subject().removeLocation(package);
  subject().removeLocation(folder);
  EXPECT_TRUE(isInstallersError(tryInstall(package, "com.a")));
  EXPECT_TRUE(isInstallersError(tryPlaceholder(folder, "com.a")));
  EXPECT_EQ(stateOf("com.a"), "absent");
}

TEST_P(AppRegistryContract, DamagedPackageLeavesAppUnchanged) {
  install("com.a", "1.0");
  EXPECT_TRUE(isInstallersError(tryInstall(subject().makeDamagedPackage("com.a"), "com.a")));
  EXPECT_EQ(stateOf("com.a"), "installed");
  EXPECT_EQ(versionOf("com.a"), "1.0");
  EXPECT_TRUE(subject().isUsable(*record("com.a")->bundlePath()));
}

TEST_P(AppRegistryContract, DamagedPackageLeavesPlaceholderUnchanged) {
  placeholder("com.a");
  EXPECT_TRUE(isInstallersError(tryInstall(subject().makeDamagedPackage("com.a"), "com.a")));
  EXPECT_EQ(stateOf("com.a"), "placeholder");
}

TEST_P(AppRegistryContract, InstallsTenAppsConcurrently) {
  constexpr std::size_t kApps = 10;
  std::vector<FileLocation> packages;
  for (std::size_t index = 0; index < kApps; ++index) {
    packages.push_back(subject().makePackage("com.a" + std::to_string(index), "1.0"));
  }
  runOnThreads(kApps, [&](std::size_t index) {
    EXPECT_TRUE(tryInstall(packages[index], "com.a" + std::to_string(index)).ok());
  });
  EXPECT_EQ(enumerate(BundleKind::user).size(), kApps);
}

TEST_P(AppRegistryContract, InstallsOneAppConcurrently) {
  constexpr std::size_t kThreads = 6;
  std::vector<FileLocation> packages;
  for (std::size_t index = 0; index < kThreads; ++index) {
    packages.push_back(subject().makePackage("com.a", std::to_string(index)));
  }
  runOnThreads(kThreads, [&](std::size_t index) { EXPECT_TRUE(tryInstall(packages[index], "com.a").ok()); });
  EXPECT_EQ(enumerate(BundleKind::user), Identifiers{"com.a"});
  EXPECT_EQ(stateOf("com.a"), "installed");
  EXPECT_TRUE(subject().isUsable(*record("com.a")->bundlePath()));
}

TEST_P(AppRegistryContract, AppsSurviveARestart) {
  install("com.app", "1.5");
  if (!subject().restart()) GTEST_SKIP() << "the subject cannot restart";
  EXPECT_EQ(stateOf("com.app"), "installed");
  EXPECT_EQ(versionOf("com.app"), "1.5");
  EXPECT_TRUE(subject().isUsable(*record("com.app")->bundlePath()));
}

// Removing.

TEST_P(AppRegistryContract, RemovesAnApp) {
  install("com.a");
  const std::string bundlePath = *record("com.a")->bundlePath();
  EXPECT_TRUE(registry().uninstallApplication("com.a").ok());
  EXPECT_EQ(stateOf("com.a"), "absent");
  EXPECT_FALSE(subject().isUsable(bundlePath));
}

TEST_P(AppRegistryContract, RemovesAPlaceholder) {
  placeholder("com.a");
  EXPECT_TRUE(registry().uninstallApplication("com.a").ok());
  EXPECT_EQ(stateOf("com.a"), "absent");
}

TEST_P(AppRegistryContract, RemovingAPlaceholderLeavesItsApp) {
  install("com.a", "1.0");
  placeholder("com.a", "2.0");
  EXPECT_TRUE(registry().uninstallApplication("com.a").ok());
  EXPECT_EQ(stateOf("com.a"), "installed");
  EXPECT_EQ(versionOf("com.a"), "1.0");
  EXPECT_TRUE(subject().isUsable(*record("com.a")->bundlePath()));
  EXPECT_EQ(removedApps(), Identifiers());
}

TEST_P(AppRegistryContract, SecondRemovalRemovesTheApp) {
  install("com.a");
  placeholder("com.a", "2.0");
  ASSERT_TRUE(registry().uninstallApplication("com.a").ok());
  EXPECT_TRUE(registry().uninstallApplication("com.a").ok());
  EXPECT_EQ(stateOf("com.a"), "absent");
  EXPECT_EQ(removedApps(), Identifiers{"com.a"});
}

TEST_P(AppRegistryContract, RemovalAfterFailedUpdateLeavesTheApp) {
  install("com.a", "1.0");
  placeholder("com.a", "2.0");
  ASSERT_FALSE(tryInstall(subject().makeDamagedPackage("com.a"), "com.a").ok());
  EXPECT_TRUE(registry().uninstallApplication("com.a").ok());
  EXPECT_EQ(stateOf("com.a"), "installed");
  EXPECT_EQ(versionOf("com.a"), "1.0");
}

TEST_P(AppRegistryContract, RemovingAnUnknownAppFails) {
  EXPECT_TRUE(isInstallersError(registry().uninstallApplication("com.a")));
  EXPECT_FALSE(registry().uninstallApplication("com.a", placeholdersOnly()).ok());
}

TEST_P(AppRegistryContract, PlaceholdersOnlyRemovesAPlaceholder) {
  placeholder("com.a");
  EXPECT_TRUE(registry().uninstallApplication("com.a", placeholdersOnly()).ok());
  EXPECT_EQ(stateOf("com.a"), "absent");
}

TEST_P(AppRegistryContract, PlaceholdersOnlyLeavesThePlaceholdersApp) {
  install("com.a", "1.0");
  placeholder("com.a", "2.0");
  EXPECT_TRUE(registry().uninstallApplication("com.a", placeholdersOnly()).ok());
  EXPECT_EQ(stateOf("com.a"), "installed");
  EXPECT_EQ(versionOf("com.a"), "1.0");
  EXPECT_TRUE(subject().isUsable(*record("com.a")->bundlePath()));
}

TEST_P(AppRegistryContract, PlaceholdersOnlyNeverRemovesAnApp) {
  install("com.a");
  static_cast<void>(registry().uninstallApplication("com.a", placeholdersOnly()));
  EXPECT_EQ(stateOf("com.a"), "installed");
}

TEST_P(AppRegistryContract, PlaceholdersOnlyFalseRemovesTheApp) {
  install("com.a");
  EXPECT_TRUE(registry().uninstallApplication("com.a", {{platform::kUninstallPlaceholdersOnlyKey, false}}).ok());
  EXPECT_EQ(stateOf("com.a"), "absent");
}

TEST_P(AppRegistryContract, RemovedAppIsListedAsUninstalled) {
  install("com.a");
  install("com.b");
  ASSERT_TRUE(registry().uninstallApplication("com.a").ok());
  EXPECT_EQ(removedApps(), Identifiers{"com.a"});
}

TEST_P(AppRegistryContract, RemovedPlaceholderIsNotListedAsUninstalled) {
  placeholder("com.placeholder");
  install("com.both");
  placeholder("com.both", "2.0");
  ASSERT_TRUE(registry().uninstallApplication("com.placeholder").ok());
  ASSERT_TRUE(registry().uninstallApplication("com.both", placeholdersOnly()).ok());
  EXPECT_EQ(removedApps(), Identifiers());
}

TEST_P(AppRegistryContract, ReinstalledAppIsNotListedAsUninstalled) {
  install("com.a");
  ASSERT_TRUE(registry().uninstallApplication("com.a").ok());
  install("com.a");
  EXPECT_EQ(removedApps(), Identifiers());
}

}  // namespace appsync::test
