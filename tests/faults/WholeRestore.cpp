#include "tests/faults/WholeRestore.h"

#include <chrono>
#include <optional>
#include <utility>

#include <gtest/gtest.h>

#include "kit/fakes/FakePackages.h"
#include "platform/SyncFiles.h"
#include "tests/faults/RestoreClock.h"
#include "tests/restore/RestoreFixture.h"

namespace appsync::test {

namespace {

using platform::ClientIdentity;
using platform::TSInstallType;

constexpr std::string_view kUnreadable = "com.unreadable";
constexpr std::string_view kWithData = "com.data";
constexpr std::string_view kWithLicence = "com.licensed";
/// An app whose backup needs no preparation.
constexpr std::string_view kUnchanged = "com.plain";
constexpr auto kMostPerApp = std::chrono::seconds(5);

const std::map<std::string, TSInstallType> kApps{
    {"com.auto", TSInstallType::Downgrade},
    {"com.data", TSInstallType::None},
    {"com.demoted", TSInstallType::IntentionalDowngrade},
    {"com.licensed", TSInstallType::None},
    {"com.plain", TSInstallType::None},
    {"com.unreadable", TSInstallType::None},
};

bool isDemoted(TSInstallType type) {
  return type != TSInstallType::None;
}

std::string metadataPath(const std::string& identifier) {
  return *FakeApp(identifier).containerPath + "/HarvoMetadata.plist";
}

plist::Dictionary metadataOf(const std::string& identifier) {
  return {{"title", "App " + identifier}, {"bundleVersion", "2.0"}};
}

/// The app's metadata after preparation for a backup.
plist::Dictionary preparedMetadataOf(const std::string& identifier) {
  plist::Dictionary metadata = metadataOf(identifier);
  if (identifier == kWithLicence) metadata.set("DeviceBasedKLP", true);
  if (identifier == kUnchanged) metadata.set("is-auto-download", false);
  return metadata;
}

}  // namespace

WholeRestore::WholeRestore(Mode mode) : mode_(mode) {
  makeNewDevice();
  for (const auto& [identifier, type] : kApps) {
    const FakeApp app = isDemoted(type) ? FakeApp::placeholder(identifier, type) : FakeApp::installed(identifier);
    device_->registry.add(identifier == kWithLicence ? app.withMIDBasedSINF() : app);
    putPropertyList(device_->files, metadataPath(identifier),
                    with(metadataOf(identifier), "is-auto-download", identifier != kUnchanged));
  }
  device_->files.put(metadataPath(std::string(kUnreadable)), "<plist>");
}

void WholeRestore::makeNewDevice() {
  device_ = std::make_unique<FakePlatform>();
  setMode(*device_, mode_);
  device_->files.putFolder(kLogFolder);
  device_->files.putFolder("/var/mobile/Media/HarvoRestore");
  device_->journal.setHook([this](std::string_view operation, std::string_view arguments) {
    const std::scoped_lock lock(hookMutex_);
    return hook_ && mutedThread_ != std::this_thread::get_id() ? hook_(operation, arguments) : std::nullopt;
  });
}

void WholeRestore::setHook(CallJournal::Hook hook) {
  const std::scoped_lock lock(hookMutex_);
  hook_ = std::move(hook);
}

void WholeRestore::prepareForBackup() {
  device_->bundleFolders.setMainBundleIdentifier(std::string(kDaemonBundleIdentifier));
  AppsClient::create(*device_)->prepareForBackup();
}

void WholeRestore::backUp() {
  prepareForBackup();
  plist::Dictionary apps;
  for (const auto& [identifier, type] : kApps) {
    plist::Dictionary entry{{"PlaceholderIcon", dataOf("icon of " + identifier)},
                            {"HarvoMetadata", plist::Value(*device_->files.contents(metadataPath(identifier)))}};
    if (identifier == kWithLicence) entry.set("ApplicationSINF", dataOf("a licence"));
    apps.set(identifier, std::move(entry));
  }
  backup_ = binaryForm(apps);
}

void WholeRestore::wipe() {
  mutedThread_ = std::this_thread::get_id();
  prepareForBackup();
  for (const auto& [identifier, type] : kApps) {
    const bool isInstalled = !isDemoted(type) && identifier != kUnreadable;
    if (!isInstalled) continue;
    EXPECT_EQ(description(propertyListAt(device_->files, metadataPath(identifier))),
              description(plist::Value(preparedMetadataOf(identifier))));
  }
  mutedThread_ = std::thread::id();
  makeNewDevice();
  device_->backups.addRestoreData(std::string(kWithData));
  const plist::Array automatic{"com.auto"};
  const plist::Array intentional{"com.demoted"};
  putPropertyList(device_->files, kDemotedApps,
                  plist::Dictionary{{"AutomaticDowngrades", automatic}, {"IntentionalDowngrades", intentional}});
}

void WholeRestore::writeRestoreFile() {
  if (device_->files.has(kRestoreInfo)) return;
  device_->files.put(kRestoreInfo, backup_);
  device_->files.erase(kFiledRestoreInfo);
  ++written_;
}

void WholeRestore::restore() {
  writeRestoreFile();
  device_->bundleFolders.setMainBundleIdentifier("com.corvel.migrator");
  RestoreClock clock(*device_);
  device_->use(clock);
  auto client = AppsClient::create(*device_);
  const TimePoint start = clock.now();
  EXPECT_TRUE(client->reconcileRestoreOfType(kHostRestore, nullptr));
  EXPECT_LE(clock.now() - start, kMostPerApp * kApps.size());
  if (mode_ == Mode::coordinated) device_->coordination.runUntilIdle();
  countRestoreFiles();
  expectBalance(*client);
  EXPECT_EQ(client.use_count(), 1) << "the plug-in still has work after the restore";
  client.reset();
  device_->use(static_cast<Clock&>(device_->time));
  if (mode_ == Mode::direct) demoteDirectly();
}

void WholeRestore::countRestoreFiles() {
  const bool isFiledAway = device_->files.has(kFiledRestoreInfo);
  EXPECT_NE(device_->files.has(kRestoreInfo), isFiledAway);
  EXPECT_EQ(device_->files.contents(isFiledAway ? kFiledRestoreInfo : kRestoreInfo), backup_);
  if (isFiledAway) ++archived_;
}

/// After all pending placeholders are withdrawn, the next one is the only one.
void WholeRestore::expectBalance(AppsClient& client) {
  mutedThread_ = std::this_thread::get_id();
  for (const auto& [identifier, type] : kApps)
    client.dataMigratorCancelledCoordinatorForRestoreAppBundle(identifier);
  client.dataMigratorSetPlaceHolderPromiseForRestoreAppBundle("com.counted");
  EXPECT_TRUE(device_->log.contains(
      logged("DataMigrator will wait for CN to install placeholder for com.counted, _restoringPlaceholderCount 1")));
  client.dataMigratorCancelledCoordinatorForRestoreAppBundle("com.counted");
  EXPECT_TRUE(device_->log.contains(
      logged("DataMigrator cancelled coordinator for restoring app bundle com.counted _restoringPlaceholderCount 0")));
  mutedThread_ = std::thread::id();
}

/// The host's part: in direct mode all placeholders are equal.
void WholeRestore::demoteDirectly() {
  for (const auto& [identifier, type] : kApps) {
    const auto app = device_->registry.app(identifier);
    if (app && isDemoted(type)) device_->registry.add(app->withInstallType(type));
  }
}

void WholeRestore::sync() {
  putPropertyList(device_->files, kStagedTodoListPath, plist::Array());
  const auto packageFor = [](const std::string& identifier) { return packageOf(identifier, "2.0"); };
  const auto neverFails = [](const std::string&) { return std::nullopt; };
  DaemonSync(*device_, mode_, {packageFor, neverFails}).run([this] { deliverFromStore(); });
}

/// Another client of the service, whose calls are not counted.
void WholeRestore::deliverFromStore() {
  constexpr ClientIdentity kStore = ClientIdentity::CXClientBazaarly;
  mutedThread_ = std::this_thread::get_id();
  FakeInstallCoordination& service = device_->coordination;
  for (const FakeCoordinator& waiting : service.coordinators()) {
    if (waiting.responsibleClient != kStore || waiting.appAsset) continue;
    const platform::FileLocation place{"/var/mobile/Media/Downloads/" + waiting.identifier, false};
    device_->files.put(place.path, packageOf(waiting.identifier, "2.0"));
    const auto coordinator = service.coordinatorForApp(waiting.kind, waiting.identifier, kStore,
                                                       platform::IfMissing::findNothing, nullptr, nullptr);
    const auto package = service.makePromisedTransferToPath(waiting.identifier + "-Asset", kStore, place, 0);
    EXPECT_TRUE(coordinator->setAppAssetPromise(package));
    package->setComplete(true);
  }
  mutedThread_ = std::thread::id();
}

void WholeRestore::cancelStalledInstalls() {
  for (const FakeCoordinator& waiting : device_->coordination.coordinators()) {
    if (waiting.appAsset && waiting.appAsset->isComplete) device_->coordination.cancelByUser(waiting.identifier);
  }
}

WholeRestore::Apps WholeRestore::apps() const {
  Apps apps;
  for (const std::string& identifier : device_->registry.identifiers()) {
    const auto app = device_->registry.app(identifier);
    const std::string type = std::to_string(static_cast<std::uint64_t>(app->installType));
    apps.push_back(identifier + " " + (app->isPlaceholder ? "placeholder " + type : app->version.value_or("none")));
  }
  return apps;
}

WholeRestore::Apps WholeRestore::readableApps() {
  return {"com.auto placeholder 7", "com.data 2.0", "com.demoted placeholder 8", "com.licensed 2.0", "com.plain 2.0"};
}

}  // namespace appsync::test
