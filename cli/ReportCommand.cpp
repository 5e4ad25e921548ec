#include <cstdint>
#include <set>
#include <string>
#include <string_view>
#include <utility>

#include "cli/Commands.h"
#include "cli/DeviceCommand.h"
#include "cli/Json.h"
#include "cli/Printable.h"
#include "cli/StandardOutput.h"
#include "daemon/ClientModule.h"
#include "host/DeviceApps.h"

namespace appsync::cli {
namespace {

using platform::RestrictionSetting;
using platform::RestrictionValue;
using platform::ZTMutableAccountInfo;

struct DeviceReportOptions {
  std::string device;
  bool json = false;
};

constexpr const char* kExamples =
    R"(Shows the plug-in's answers to the sync daemon: the number and size of the apps, the store accounts that own them, and
the disabled dataclasses: "Application" if apps may be neither installed nor removed. Accounts are read from the apps'
store metadata; if an app's metadata is inconsistent, two identifiers are shown. An app whose metadata is missing or
cannot be read has no account.

With --json: one object:
  metrics             {count, physicalSize, purgeableSize}, the sizes in bytes
  corvelIDs           array of the accounts' identifiers
  accounts            array of {corvelID, DSID, altDSID}; DSID is a number, and unknown values are null
  disabledAssetTypes  array of dataclasses
  restrictions        {"app-installation", "app-removal"}, each "yes", "no" or "unset"

Examples:
  appsync report phone
  appsync report phone --json | jq -r '.corvelIDs[]')";

/// The report on a device.
struct Report {
  std::uint64_t count = 0;
  std::uint64_t physicalSize = 0;
  std::uint64_t purgeableSize = 0;
  std::set<std::string> identifiers;
  platform::ZTAccountInfos accounts;
  std::set<std::string> disabledTypes;
  RestrictionValue installation = RestrictionValue::unset;
  RestrictionValue removal = RestrictionValue::unset;
};

std::uint64_t metric(const plist::Dictionary& metrics, std::string_view key) {
  const plist::Value* number = metrics.find(key);
  return number == nullptr ? 0 : number->uint64().value_or(0);
}

Report ask(platform::ZTClient& client, platform::ProfileConnection& restrictions) {
  const plist::Dictionary metrics = client.installedAssetMetrics();
  Report report;
  report.count = metric(metrics, platform::kMetricCount);
  report.physicalSize = metric(metrics, platform::kMetricPhysicalSize);
  report.purgeableSize = metric(metrics, platform::kMetricPurgeableSize);
  report.identifiers = client.corvelIDsForAssets();
  report.accounts = client.accountsForAssets();
  report.disabledTypes = client.disabledAssetTypes().value_or(std::set<std::string>());
  report.installation = restrictions.effectiveBoolValueForSetting(RestrictionSetting::appInstallationAllowed);
  report.removal = restrictions.effectiveBoolValueForSetting(RestrictionSetting::appRemovalAllowed);
  return report;
}

std::string_view wordOf(RestrictionValue value) {
  if (value == RestrictionValue::unset) return "unset";
  return value == RestrictionValue::no ? "no" : "yes";
}

Json accountJson(const ZTMutableAccountInfo& account) {
  return {{"corvelID", account.corvelID()},
          {"DSID", account.DSID() ? toJson(*account.DSID()) : Json(nullptr)},
          {"altDSID", account.altDSID() ? Json(*account.altDSID()) : Json(nullptr)}};
}

Json reportJson(const Report& report) {
  Json accounts = Json::array();
  for (const ZTMutableAccountInfo& account : report.accounts)
    accounts.push_back(accountJson(account));
  return {
      {"metrics",
       {{"count", report.count}, {"physicalSize", report.physicalSize}, {"purgeableSize", report.purgeableSize}}},
      {"corvelIDs", Json(report.identifiers)},
      {"accounts", std::move(accounts)},
      {"disabledAssetTypes", Json(report.disabledTypes)},
      {"restrictions", {{"app-installation", wordOf(report.installation)}, {"app-removal", wordOf(report.removal)}}}};
}

std::string shown(std::string_view text) {
  return text.empty() ? "(empty)" : printable(text);
}

std::string shown(const ZTMutableAccountInfo& account) {
  std::string line = shown(account.corvelID());
  if (account.DSID()) line += "  DSID " + printable(description(*account.DSID()));
  if (account.altDSID()) line += "  altDSID " + shown(*account.altDSID());
  return line;
}

/// Writes a title and a line for each item; nothing if the list is empty.
template <class Items>
void writeList(StandardOutput& output, std::string_view title, const Items& items) {
  if (items.empty()) return;
  output.writeLine("");
  output.writeLine(title);
  for (const auto& item : items)
    output.writeLine("  " + shown(item));
}

void write(StandardOutput& output, const Report& report) {
  output.writeLine("apps               " + std::to_string(report.count) + ", " + byteCount(report.physicalSize));
  output.writeLine("can be purged      " + byteCount(report.purgeableSize));
  output.writeLine(std::string("app-installation   ").append(wordOf(report.installation)));
  output.writeLine(std::string("app-removal        ").append(wordOf(report.removal)));
  writeList(output, "disabled", report.disabledTypes);
  writeList(output, "account identifiers", report.identifiers);
  writeList(output, "accounts", report.accounts);
}

ExitStatus run(const DeviceReportOptions& options, device::Device& device) {
  const auto client = daemon::makeClient(device.platform());
  if (!client) return reportUnusable(client.error());
  // The plug-in treats a registry that cannot be read as empty.
  if (const auto apps = host::appsOn(device); !apps) return reportUnusable(apps.error());
  const Report report = ask(**client, device.platform().sharedConnection());
  StandardOutput output;
  if (options.json) {
    output.writeLine(indented(reportJson(report)));
  } else {
    write(output, report);
  }
  return output.finish(ExitStatus::done);
}

}  // namespace

void addReportCommand(CLI::App& line, Invocation& invocation) {
  const CommandText text = {"report", "Report the number, size and accounts of the apps on a device.", kExamples};
  addListingCommand(line, invocation, text, run);
}

}  // namespace appsync::cli
