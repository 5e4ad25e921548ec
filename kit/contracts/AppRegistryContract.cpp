#include "kit/contracts/AppRegistryContract.h"

#include <algorithm>
#include <cstdint>
#include <thread>

#include "platform/Keys.h"

namespace appsync::test {

using platform::AppRecord;
using platform::BundleKind;
using platform::BundleRecord;
using platform::FileLocation;
using platform::PlaceholderLookup;
using platform::TSInstallType;

GTEST_ALLOW_UNINSTANTIATED_PARAMETERIZED_TEST(AppRegistryContract);

namespace {

using Identifiers = std::vector<std::string>;

}  // namespace

plist::Dictionary AppRegistryContract::options(std::string_view packageType, std::string_view identifier) {
  return {{platform::PackageTypeKey, packageType}, {platform::BundleIdentifierKey, identifier}};
}

Status AppRegistryContract::tryInstall(const FileLocation& package, std::string_view identifier) {
  return registry().installApplication(package, options(platform::kPackageTypeCustomer, identifier));
}

Status AppRegistryContract::tryPlaceholder(const FileLocation& folder, std::string_view identifier) {
  plist::Dictionary withType = options(platform::PackageTypePlaceholder, identifier);
  withType.set(platform::kInstallTypeKey, static_cast<std::uint64_t>(TSInstallType::Sync));
  return registry().installApplication(folder, withType);
}

void AppRegistryContract::install(std::string_view identifier, std::string_view version) {
  const Status status = tryInstall(subject().makePackage(identifier, version), identifier);
  ASSERT_TRUE(status.ok()) << status.error().text;
}

void AppRegistryContract::placeholder(std::string_view identifier, std::string_view version) {
  const Status status = tryPlaceholder(subject().makePlaceholderFolder(identifier, version), identifier);
  ASSERT_TRUE(status.ok()) << status.error().text;
}

std::shared_ptr<const AppRecord> AppRegistryContract::record(std::string_view identifier) {
  return registry().recordForIdentifier(identifier, PlaceholderLookup::on);
}

std::string AppRegistryContract::stateOf(std::string_view identifier) {
  const auto found = record(identifier);
  if (found == nullptr) return "absent";
  if (found->isInstalled()) return found->isPlaceholder() ? "both" : "installed";
  return found->isPlaceholder() ? "placeholder" : "neither";
}

std::optional<std::string> AppRegistryContract::versionOf(std::string_view identifier) {
  const auto found = record(identifier);
  return found == nullptr ? std::nullopt : found->bundleVersion();
}

std::shared_ptr<platform::InstallProgress> AppRegistryContract::progressOf(std::string_view identifier) {
  const auto found = record(identifier);
  return found == nullptr ? nullptr
                          : registry().installProgressForApplication(*found, platform::TSInstallPhase::Loading);
}

std::vector<std::string> AppRegistryContract::enumerate(BundleKind kind) {
  Identifiers found;
  registry().enumerateBundlesOfType(
      kind, [&](const BundleRecord& bundle, bool&) { found.push_back(bundle.applicationIdentifier()); });
  return found;
}

std::vector<std::string> AppRegistryContract::removedApps() {
  Identifiers removed;
  const std::optional<plist::Dictionary> answer = subject().uninstalledApps().lookupUninstalled();
  if (!answer) return {"(no answer)"};
  for (const auto& [identifier, value] : *answer)
    removed.emplace_back(identifier);
  return removed;
}

// Look-ups.

TEST_P(AppRegistryContract, UnknownAppIsNotFound) {
  EXPECT_FALSE(registry().applicationIsInstalled("com.a"));
  EXPECT_EQ(registry().recordForIdentifier("com.a", PlaceholderLookup::on), nullptr);
  EXPECT_EQ(registry().recordForIdentifier("com.a", PlaceholderLookup::off), nullptr);
  EXPECT_FALSE(registry().applicationIsInstalled(""));
}

TEST_P(AppRegistryContract, AppsAndPlaceholdersCountAsInstalled) {
  install("com.app");
  placeholder("com.placeholder");
  EXPECT_TRUE(registry().applicationIsInstalled("com.app"));
  EXPECT_TRUE(registry().applicationIsInstalled("com.placeholder"));
  EXPECT_FALSE(registry().applicationIsInstalled("com.APP"));
}

TEST_P(AppRegistryContract, LookupOffDoesNotFindPlaceholders) {
  placeholder("com.a");
  EXPECT_EQ(registry().recordForIdentifier("com.a", PlaceholderLookup::off), nullptr);
  EXPECT_NE(registry().recordForIdentifier("com.a", PlaceholderLookup::on), nullptr);
}

TEST_P(AppRegistryContract, AppBeingUpdatedIsFoundByBothLookups) {
  install("com.a");
  placeholder("com.a", "2.0");
  EXPECT_NE(registry().recordForIdentifier("com.a", PlaceholderLookup::off), nullptr);
  EXPECT_NE(registry().recordForIdentifier("com.a", PlaceholderLookup::on), nullptr);
}

TEST_P(AppRegistryContract, RecordDescribesTheApp) {
  install("com.a", "1.2.3");
  const auto found = record("com.a");
  ASSERT_NE(found, nullptr);
  EXPECT_EQ(found->applicationIdentifier(), "com.a");
  EXPECT_EQ(found->bundleIdentifier(), "com.a");
  EXPECT_EQ(found->bundleVersion(), "1.2.3");
  EXPECT_EQ(found->applicationType(), platform::kApplicationTypeUser);
  EXPECT_EQ(found->asAppRecord(), found.get());
  EXPECT_FALSE(found->description().empty());
  ASSERT_TRUE(found->bundlePath());
  ASSERT_TRUE(found->bundleContainerPath());
  EXPECT_TRUE(found->bundlePath()->starts_with(*found->bundleContainerPath() + "/")) << *found->bundlePath();
  EXPECT_TRUE(found->bundlePath()->ends_with(".app")) << *found->bundlePath();
  EXPECT_TRUE(subject().isUsable(*found->bundlePath()));
}

TEST_P(AppRegistryContract, RecordIsASnapshot) {
  install("com.a", "1.0");
  const auto before = record("com.a");
  ASSERT_NE(before, nullptr);
  install("com.a", "2.0");
  EXPECT_EQ(before->bundleVersion(), "1.0");
  ASSERT_TRUE(registry().uninstallApplication("com.a").ok());
  EXPECT_EQ(before->bundleVersion(), "1.0");
  EXPECT_TRUE(before->isInstalled());
}

TEST_P(AppRegistryContract, DiskUsageIsThatOfTheInstalledBundle) {
  install("com.a", "1.0");
  const std::uint64_t installed = record("com.a")->staticDiskUsage();
  EXPECT_GT(installed, 0U);
  placeholder("com.a", "2.0.0.0.0");
  EXPECT_EQ(record("com.a")->staticDiskUsage(), installed);
  const auto before = record("com.a");
  install("com.a", "2.0.0.0.0");
  EXPECT_NE(record("com.a")->staticDiskUsage(), installed);
  EXPECT_EQ(before->staticDiskUsage(), installed);
}

// Enumerations.

TEST_P(AppRegistryContract, EnumeratesEveryUserBundle) {
  install("com.app");
  placeholder("com.placeholder");
  install("com.both");
  placeholder("com.both", "2.0");
  for (const BundleKind kind : {BundleKind::all, BundleKind::user}) {
    Identifiers found = enumerate(kind);
    std::ranges::sort(found);
    EXPECT_EQ(found, (Identifiers{"com.app", "com.both", "com.placeholder"}));
  }
  EXPECT_EQ(enumerate(BundleKind::system), Identifiers());
}

TEST_P(AppRegistryContract, EnumeratesSystemBundlesOnly) {
  install("com.user");
  if (!subject().addSystemApp("com.system")) GTEST_SKIP() << "the subject has no system apps";
  EXPECT_EQ(enumerate(BundleKind::system), Identifiers{"com.system"});
  EXPECT_EQ(enumerate(BundleKind::user), Identifiers{"com.user"});
  EXPECT_EQ(enumerate(BundleKind::all).size(), 2U);
}

TEST_P(AppRegistryContract, EnumeratesBundlesThatAreNotApps) {
  install("com.app");
  if (!subject().addExtension("com.app.extension")) GTEST_SKIP() << "the subject has no extensions";
  Identifiers found;
  registry().enumerateBundlesOfType(BundleKind::all, [&](const BundleRecord& bundle, bool&) {
    found.push_back(bundle.applicationIdentifier());
    EXPECT_EQ(bundle.asAppRecord() != nullptr, found.back() == "com.app") << found.back();
    EXPECT_FALSE(bundle.description().empty());
  });
  std::ranges::sort(found);
  EXPECT_EQ(found, (Identifiers{"com.app", "com.app.extension"}));
}

TEST_P(AppRegistryContract, EnumeratesInAStableOrder) {
  for (const char* identifier : {"com.c", "com.a", "com.b"})
    install(identifier);
  EXPECT_EQ(enumerate(BundleKind::all), enumerate(BundleKind::all));
}

TEST_P(AppRegistryContract, EnumeratesCompleteRecords) {
  install("com.app", "1.5");
  placeholder("com.placeholder");
  registry().enumerateBundlesOfType(BundleKind::user, [](const BundleRecord& bundle, bool&) {
    const AppRecord* app = bundle.asAppRecord();
    ASSERT_NE(app, nullptr);
    const bool isApp = bundle.applicationIdentifier() == "com.app";
    EXPECT_EQ(app->isInstalled(), isApp);
    EXPECT_EQ(app->isPlaceholder(), !isApp);
    EXPECT_EQ(app->bundleVersion(), isApp ? "1.5" : "1.0");
  });
}

TEST_P(AppRegistryContract, StopEndsAnEnumeration) {
  for (const char* identifier : {"com.a", "com.b", "com.c"})
    install(identifier);
  int visits = 0;
  registry().enumerateBundlesOfType(BundleKind::all, [&](const BundleRecord&, bool& stop) { stop = ++visits == 2; });
  EXPECT_EQ(visits, 2);
}

TEST_P(AppRegistryContract, EnumeratesOnTheCallingThread) {
  install("com.a");
  registry().enumerateBundlesOfType(BundleKind::all, [caller = std::this_thread::get_id()](const BundleRecord&, bool&) {
    EXPECT_EQ(std::this_thread::get_id(), caller);
  });
}

TEST_P(AppRegistryContract, EnumeratesASnapshot) {
  for (const char* identifier : {"com.a", "com.b", "com.c"})
    install(identifier);
  Identifiers found;
  registry().enumerateBundlesOfType(BundleKind::all, [&](const BundleRecord& bundle, bool&) {
    if (found.empty()) {
      install("com.d");
      for (const char* identifier : {"com.a", "com.b", "com.c"}) {
        EXPECT_TRUE(registry().uninstallApplication(identifier).ok());
      }
    }
    found.push_back(bundle.applicationIdentifier());
  });
  std::ranges::sort(found);
  EXPECT_EQ(found, (Identifiers{"com.a", "com.b", "com.c"}));
  EXPECT_EQ(enumerate(BundleKind::all), Identifiers{"com.d"});
}

}  // namespace appsync::test
