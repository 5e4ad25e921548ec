#include <algorithm>
#include <array>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "cli/Commands.h"
#include "cli/DeviceCommand.h"
#include "cli/StandardOutput.h"
#include "device/apps/Demotion.h"
#include "device/packages/InstallerError.h"
#include "device/storage/HostFile.h"

namespace appsync::cli {
namespace {

struct SetOptions {
  std::string device;
  std::vector<std::string> assignments;
};

using device::InstallerFailure;
using platform::TSInstallType;

/// A key that acts on an app instead of setting a value.
struct AppAction {
  std::string_view key;
  Status (*perform)(device::Device& device, const std::string& value);
};

template <TSInstallType kType>
Status demote(device::Device& device, const std::string& identifier) {
  device::Services& services = device.services();
  return device::demote(services.defaultRegistry(), services.fileSystem(), identifier, kType);
}

constexpr std::uint64_t kLargestLicence = 16'000'000;

/// `value` is "ID:FILE".
Status setLicence(device::Device& device, const std::string& value) {
  const std::size_t colon = value.find(':');
  if (colon == value.npos) {
    return device::installerError(InstallerFailure::badOptions, "licence needs a value ID:FILE");
  }
  const Result<Bytes> licence = device::readHostFile(value.substr(colon + 1), kLargestLicence);
  if (!licence) return licence.error();
  return device.services().defaultRegistry().setLicenceData(value.substr(0, colon), *licence);
}

constexpr std::array<AppAction, 3> kAppActions = {{{"demote", demote<TSInstallType::IntentionalDowngrade>},
                                                   {"demote-auto", demote<TSInstallType::Downgrade>},
                                                   {"licence", setLicence}}};

constexpr const char* kExamples = R"(Keys and their values:
  app-installation   yes, no or unset: whether apps may be installed
  app-removal        yes, no or unset: whether apps may be removed
  coordination       on, off or unset: whether the next syncs install apps through coordinators, so that `appsync
                     tap` and `appsync cancel` have an effect
  assertion          ID:granted, ID:denied, ID:unknown, ID:failing or ID:unset: the home screen's answer when a
                     direct install is about to replace app ID; no effect on coordinated installs
  store              a folder of packages, or unset: the source of the packages of apps that were restored through
                     coordinators
  demote             ID: removes an installed app except its icon and data, as on a user's request
  demote-auto        ID: removes an installed app except its icon and data, as for lack of space
  licence            ID:FILE: sets the licence data of an app to the content of FILE

Examples:
  appsync set phone app-removal=no
  appsync set phone demote=org.example.tides
  appsync set phone app-removal=unset app-installation=unset
  appsync set phone coordination=off)";

/// Sets a setting. The error for an unknown key lists the actions, too.
Status assignSetting(device::Settings& settings, const std::string& assignment) {
  Status set = settings.assign(assignment);
  const bool isKnown = set || set.error().code != static_cast<long>(device::SettingsFailure::unknownKey);
  if (isKnown) return set;
  Error unknown = set.error();
  for (const AppAction& action : kAppActions)
    unknown.text.append(", ").append(action.key);
  return unknown;
}

Status assign(device::Device& device, const std::string& assignment) {
  const std::size_t equals = assignment.find('=');
  const auto action = std::ranges::find(kAppActions, std::string_view(assignment).substr(0, equals), &AppAction::key);
  if (equals == assignment.npos || action == kAppActions.end())
    return assignSetting(device.services().settings(), assignment);
  return action->perform(device, assignment.substr(equals + 1));
}

ExitStatus run(const SetOptions& options, device::Device& device) {
  for (const std::string& assignment : options.assignments) {
    const Status set = assign(device, assignment);
    if (set) continue;
    const bool isWrongUsage =
        set.error().domain == device::kSettingsDomain || set.error().domain == platform::kInstallerErrorDomain;
    if (!isWrongUsage) return reportUnusable(set.error());
    printError(set.error().text);
    return ExitStatus::wrongUsage;
  }
  return ExitStatus::done;
}

}  // namespace

void addSetCommand(CLI::App& line, Invocation& invocation) {
  const CommandText text = {"set", "Change a device's settings.", kExamples};
  const auto added = addDeviceCommand(line, invocation, text, device::Access::exclusive, run);
  added.command.add_option("KEY=VALUE", added.options->assignments, "the setting to change")->required();
}

}  // namespace appsync::cli
