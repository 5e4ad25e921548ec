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

/// What is done to an app rather than set.
struct Deed {
  std::string_view key;
  Status (*perform)(device::Device& device, const std::string& value);
};

template <TSInstallType kType>
Status demote(device::Device& device, const std::string& identifier) {
  device::Services& services = device.services();
  return device::demote(services.defaultRegistry(), services.fileSystem(), identifier, kType);
}

constexpr std::uint64_t kLargestLicence = 16'000'000;

/// "ID:FILE"
Status giveLicence(device::Device& device, const std::string& value) {
  const std::size_t colon = value.find(':');
  if (colon == value.npos) {
    return device::installerError(InstallerFailure::badOptions, "setting licence takes ID:FILE");
  }
  const Result<Bytes> licence = device::readHostFile(value.substr(colon + 1), kLargestLicence);
  if (!licence) return licence.error();
  return device.services().defaultRegistry().setLicenceData(value.substr(0, colon), *licence);
}

constexpr std::array<Deed, 3> kDeeds = {{{"demote", demote<TSInstallType::IntentionalDowngrade>},
                                         {"demote-auto", demote<TSInstallType::Downgrade>},
                                         {"licence", giveLicence}}};

constexpr const char* kExamples = R"(Keys and their values:
  app-installation   yes, no or unset: whether apps may be installed
  app-removal        yes, no or unset: whether apps may be removed
  coordination       on, off or unset: whether apps are installed through coordinators, which can be tapped and
                     cancelled while a sync runs; from the next sync on
  assertion          ID:granted, ID:denied, ID:unknown, ID:failing or ID:unset: what the home screen
                     answers when app ID is about to be replaced; only a device that installs directly asks, so
                     it has no effect through coordinators
  store              a folder of packages, or unset: where an app that was restored through coordinators gets its
                     package from
  demote             ID: leaves of an installed app the icon and the data, as a person wishes it
  demote-auto        ID: the same, as a device does it that needs room
  licence            ID:FILE: gives an app the licence data in FILE

Examples:
  appsync set phone app-removal=no
  appsync set phone demote=org.example.tides
  appsync set phone app-removal=unset app-installation=unset
  appsync set phone coordination=off)";

/// Sets a setting. Who names none hears of the deeds as well.
Status assignSetting(device::Settings& settings, const std::string& assignment) {
  Status set = settings.assign(assignment);
  const bool isKnown = set || set.error().code != static_cast<long>(device::SettingsFailure::unknownKey);
  if (isKnown) return set;
  Error unknown = set.error();
  for (const Deed& deed : kDeeds)
    unknown.text.append(", ").append(deed.key);
  return unknown;
}

Status assign(device::Device& device, const std::string& assignment) {
  const std::size_t equals = assignment.find('=');
  const auto deed = std::ranges::find(kDeeds, std::string_view(assignment).substr(0, equals), &Deed::key);
  if (equals == assignment.npos || deed == kDeeds.end()) return assignSetting(device.services().settings(), assignment);
  return deed->perform(device, assignment.substr(equals + 1));
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
  added.command.add_option("KEY=VALUE", added.options->assignments, "what to set")->required();
}

}  // namespace appsync::cli
