#include "tests/faults/WholeSync.h"

#include <array>
#include <chrono>
#include <optional>
#include <thread>

#include <gtest/gtest.h>

#include "core/SyncFiles.h"
#include "kit/fakes/FakePackages.h"
#include "kit/fakes/TodoList.h"

namespace appsync::test {

namespace {

using platform::TSInstallType;
using platform::ZTAsset;

constexpr std::string_view kRestoreStatePath = "/var/mobile/Library/ApplicationSync/RestoreState.plist";
constexpr std::string_view kParkedPackage = "/var/mobile/Media/PublicStaging/parked.zip";

constexpr std::string_view kStartupCompleteNotification = "com.corvel.zeph.ZTStartupCompleteNotification";

/// What the host wants on the device.
const std::map<std::string, std::string> kLibrary{
    {"com.bad", "2.0"},     // its package is another app's
    {"com.broken", "2.0"},  // its transfer fails for good at first
    {"com.denied", "2.0"},  // the home screen holds it back at first
    {"com.flaky", "2.0"},   // its transfer fails for now at first
    {"com.new", "2.0"},    {"com.parked", "2.0"}, {"com.restored", "2.0"}, {"com.update", "2.0"},
};
constexpr std::string_view kToRemove = "com.gone";

bool isRestored(std::string_view identifier) {
  return identifier == "com.parked" || identifier == "com.restored";
}

const Error kLostForGood{"ZTError", 7, "the host has lost the package", nullptr};
const Error kLostForNow{"ZTError", 8, "the host went away", nullptr};

/// More attempts than any single failure can cost.
constexpr int kMostAttempts = 10;

}  // namespace

std::ostream& operator<<(std::ostream& out, const AppState& state) {
  return out << state.identifier << ' ' << state.version << (state.isInstalled ? " installed" : "")
             << (state.isPlaceholder ? " placeholder" : "");
}

WholeSync::WholeSync(Mode mode) : mode_(mode) {
  if (mode == Mode::coordinated) {
    platform.coordination.enable();
    platform.coordination.installAutomatically();
    platform.coordination.gate.close();
  }
  for (const char* identifier : {"com.gone", "com.keep", "com.update"})
    platform.registry.add(FakeApp::installed(identifier));
  for (const char* identifier : {"com.parked", "com.restored"}) {
    platform.registry.add(FakeApp::placeholder(identifier, TSInstallType::Restore).withVersion("2.0"));
    platform.backups.addRestoreData(identifier);
  }
  platform.files.put(kParkedPackage, packageOf("com.parked", "2.0"));
  putPropertyList(
      platform.files, kRestoreStatePath,
      plist::Dictionary{{"com.parked", plist::Dictionary{{"2.0", plist::Dictionary{{"path", kParkedPackage}}}}}});
  platform.files.put(kLastSyncStatePath, binaryForm(plist::Array{"com.keep", "com.forgotten"}));
  platform.uninstalledList.add("com.deleted");
  platform.screen.setFlattenedIconState({"com.update", "com.denied"});
  platform.screen.answerNext("com.denied", {AssertionAnswer::denied(), AssertionAnswer::denied()});
  platform.bundleFolders.setMainBundleIdentifier("com.corvel.zeph");
  platform.framework.judgeErrorsBy([](const Error& error) { return error == kLostForNow; });
}

void WholeSync::run(Transfers transfers) {
  stage();
  client_ = AppsClient::create(platform);
  platform.notify.deliver(kStartupCompleteNotification);
  client_->prepareForSyncWithHostAnchor(client_->currentSyncAnchor(), {}, nullptr);
  static_cast<void>(client_->installedAssets());
  std::optional<Error> error;
  if (client_->reconcileSync({}, "anchor", {}, &error)) {
    waitForInstalls();
    const auto outstanding = client_->outstandingAssetTransfers();
    waitForInstalls();
    for (const Asset& asset : outstanding)
      transfer(asset, transfers);
    client_->assetTransferEndedWithSuccess(true);
    waitForInstalls();
    client_->syncEndedWithSuccess(true);
  } else {
    EXPECT_TRUE(error) << "a refused sync must say why";
    client_->syncEndedWithSuccess(false);
  }
  EXPECT_EQ(client_.use_count(), 1) << "work of the plug-in outlives the sync";
  client_.reset();
}

void WholeSync::restartDevice() {
  for (const FakeCoordinator& coordinator : platform.coordination.coordinators()) {
    platform.coordination.cancel(coordinator.identifier, {kLostForNow, platform::ClientIdentity::CXClientSync});
  }
  for (const std::string& identifier : platform.registry.identifiers()) {
    const auto app = platform.registry.app(identifier);
    if (!app->isPlaceholder || app->installType != TSInstallType::Sync) continue;
    EXPECT_TRUE(
        platform.registry.uninstallApplication(identifier, {{platform::UninstallPlaceholdersOnlyKey, true}}).ok());
  }
}

DeviceState WholeSync::deviceState() const {
  DeviceState state;
  for (const std::string& identifier : platform.registry.identifiers()) {
    const auto app = platform.registry.app(identifier);
    state.push_back({identifier, app->version.value_or("none"), app->isInstalled, app->isPlaceholder});
  }
  return state;
}

std::map<std::string, std::string> WholeSync::todoWords() {
  std::map<std::string, std::string> words;
  for (const auto& [identifier, word] : asked_)
    words[identifier] = operationWord(platform.files, identifier).value_or("none");
  return words;
}

std::map<std::string, std::string> WholeSync::expectedTodoWords() const {
  std::map<std::string, std::string> words = asked_;
  for (auto& [identifier, word] : words) {
    if (word == "install") word = identifier == "com.bad" ? "FAILED" : "INSTALLED";
  }
  return words;
}

/// The host's part before the sync. None of it passes through the platform's calls.
void WholeSync::stage() {
  platform.files.erase(kStagingFolder);
  asked_.clear();
  plist::Array todoList;
  for (const auto& [identifier, version] : kLibrary) {
    if (!isWanted(identifier, version)) continue;
    todoList.emplace_back(installEntry(identifier, version, "Name of " + identifier));
    asked_[identifier] = "install";
    putAppFolder(platform.files, std::string(kStagingFolder) + "/" + identifier, identifier, "App " + identifier);
  }
  if (platform.registry.app(kToRemove)) {
    todoList.emplace_back(removeEntry(kToRemove));
    asked_[std::string(kToRemove)] = "remove";
  }
  platform.files.put(kStagedTodoListPath, binaryForm(std::move(todoList)));
  putPropertyList(platform.files, std::string(kStagingFolder) + "/SolvaryIconState.plist",
                  plist::Array{plist::Array{"com.update", "com.denied"}});
}

bool WholeSync::isWanted(const std::string& identifier, const std::string& version) const {
  if (mode_ == Mode::coordinated && isRestored(identifier)) return false;
  const auto app = platform.registry.app(identifier);
  return !app || !app->isInstalled || app->version != version;
}

void WholeSync::transfer(const Asset& asset, Transfers transfers) {
  const std::string& identifier = asset->identifier();
  const plist::Value* parts = asset->variantOptions().find(platform::kAssetPartsKey);
  ASSERT_NE(parts, nullptr);
  client_->assetTransferUpdatedProgress(asset, 0.5);
  if (transfers == Transfers::someFail && (identifier == "com.broken" || identifier == "com.flaky")) {
    client_->assetTransferSucceeded(asset, false, identifier == "com.broken" ? kLostForGood : kLostForNow);
    waitForInstalls();
    return;
  }
  client_->assetTransferUpdatedProgress(asset, 1.0);
  if (*parts != plist::Value(platform::kZTAssetPartApplicationData)) send(asset);
  if (asset->isRestore()) sendData(asset);
}

void WholeSync::send(const Asset& asset) {
  const std::string& identifier = asset->identifier();
  platform.files.put(std::string(kPublicStaging) + "/" + identifier + ".zip",
                     packageOf(identifier == "com.bad" ? "com.other" : identifier, "2.0"));
  asset->setPath(identifier + ".zip");
  asset->setCompletedAssetParts(platform::kZTAssetPartApplication);
  client_->assetTransferSucceeded(asset, true, std::nullopt);
  waitForInstalls();
}

/// The data part is a transfer of its own: an asset whose transfer has ended belongs to the plug-in.
void WholeSync::sendData(const Asset& asset) {
  const auto data = std::make_shared<ZTAsset>(asset->identifier(), asset->dataclass(), asset->prettyName());
  data->setIsDownload(true);
  data->setIsRestore(true);
  data->setVariantOptions(asset->variantOptions());
  data->setCompletedAssetParts(platform::kZTAssetPartApplicationData);
  client_->assetTransferSucceeded(data, true, std::nullopt);
  waitForInstalls();
}

/// While the daemon calls the client the service's thread stands still: all calls come in one order.
void WholeSync::waitForInstalls() {
  if (mode_ == Mode::coordinated) {
    platform.coordination.runUntilIdle();
  } else {
    waitForDirectInstalls();
  }
}

/// Installs own a share of the client until their last call is over, and so do those that wait to be tried again.
void WholeSync::waitForDirectInstalls() {
  for (int attempt = 0; attempt < kMostAttempts; ++attempt) {
    while (true) {
      const std::size_t waiting = platform.time.pendingTasks();
      if (client_.use_count() == static_cast<long>(1 + waiting)) break;
      std::this_thread::yield();
    }
    if (platform.time.pendingTasks() == 0) return;
    platform.time.advance(std::chrono::seconds(30));
  }
  ADD_FAILURE() << "an install is tried again without end";
}

}  // namespace appsync::test
