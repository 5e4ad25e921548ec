#include "tests/faults/WholeSync.h"

#include <optional>

#include <gtest/gtest.h>

#include "kit/fakes/FakePackages.h"
#include "kit/fakes/SyncFileBuilder.h"
#include "platform/SyncFiles.h"

namespace appsync::test {

namespace {

using platform::TSInstallType;

constexpr std::string_view kParkedPackage = "/var/mobile/Media/PublicStaging/parked.zip";

/// The apps that the host wants on the device.
const std::map<std::string, std::string> kLibrary{
    {"com.bad", "2.0"},     // the package is of another app
    {"com.broken", "2.0"},  // the first transfer fails unrecoverably
    {"com.denied", "2.0"},  // the home screen first denies the assertion
    {"com.flaky", "2.0"},   // the first transfer fails recoverably
    {"com.new", "2.0"},    {"com.parked", "2.0"}, {"com.restored", "2.0"}, {"com.update", "2.0"},
};
constexpr std::string_view kToRemove = "com.gone";

bool isRestored(std::string_view identifier) {
  return identifier == "com.parked" || identifier == "com.restored";
}

const Error kLostForGood{"ZTError", 7, "the host has lost the package", nullptr};
const Error kLostForNow{"ZTError", 8, "the host went away", nullptr};

}  // namespace

std::ostream& operator<<(std::ostream& out, const AppState& state) {
  return out << state.identifier << ' ' << state.version << (state.isInstalled ? " installed" : "")
             << (state.isPlaceholder ? " placeholder" : "");
}

WholeSync::WholeSync(Mode mode) : mode_(mode) {
  setMode(platform, mode);
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
  platform.framework.judgeErrorsBy([](const Error& error) { return error == kLostForNow; });
}

void WholeSync::run(Transfers transfers) {
  stage();
  const auto packageFor = [](const std::string& identifier) {
    return packageOf(identifier == "com.bad" ? "com.other" : identifier, "2.0");
  };
  const auto failureOf = [transfers](const std::string& identifier) -> std::optional<Error> {
    if (transfers == Transfers::allArrive) return std::nullopt;
    if (identifier == "com.broken") return kLostForGood;
    return identifier == "com.flaky" ? std::optional(kLostForNow) : std::nullopt;
  };
  DaemonSync(platform, mode_, {packageFor, failureOf}).run();
}

void WholeSync::restartDevice() {
  for (const FakeCoordinator& coordinator : platform.coordination.coordinators()) {
    platform.coordination.cancel(coordinator.identifier, {kLostForNow, platform::ClientIdentity::CXClientSync});
  }
  for (const std::string& identifier : platform.registry.identifiers()) {
    const auto app = platform.registry.app(identifier);
    if (!app->isPlaceholder || app->installType != TSInstallType::Sync) continue;
    EXPECT_TRUE(
        platform.registry.uninstallApplication(identifier, {{platform::kUninstallPlaceholdersOnlyKey, true}}).ok());
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

std::map<std::string, std::string> WholeSync::todoOperations() {
  std::map<std::string, std::string> words;
  for (const auto& [identifier, word] : requested_)
    words[identifier] = operationWord(platform.files, identifier).value_or("none");
  return words;
}

std::map<std::string, std::string> WholeSync::expectedTodoOperations() const {
  std::map<std::string, std::string> words = requested_;
  for (auto& [identifier, word] : words) {
    if (word == "install") word = identifier == "com.bad" ? "FAILED" : "INSTALLED";
  }
  return words;
}

/// The host's part before the sync; makes no platform calls.
void WholeSync::stage() {
  platform.files.erase(kStagingFolder);
  requested_.clear();
  plist::Array todoList;
  for (const auto& [identifier, version] : kLibrary) {
    if (!isWanted(identifier, version)) continue;
    todoList.emplace_back(installEntry(identifier, version, "Name of " + identifier));
    requested_[identifier] = "install";
    putAppFolder(platform.files, std::string(kStagingFolder) + "/" + identifier, identifier, "App " + identifier);
  }
  if (platform.registry.app(kToRemove)) {
    todoList.emplace_back(removeEntry(kToRemove));
    requested_[std::string(kToRemove)] = "remove";
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

}  // namespace appsync::test
