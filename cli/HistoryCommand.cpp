#include "base/TimeText.h"
#include "cli/Commands.h"
#include "cli/DeviceCommand.h"
#include "cli/Json.h"
#include "cli/Printable.h"
#include "cli/StandardOutput.h"
#include "device/services/TransactionLog.h"

namespace appsync::cli {
namespace {

using device::TransactionEntry;

struct HistoryOptions {
  std::string device;
  bool json = false;
};

constexpr const char* kExamples =
    R"(Each line is one event: its time in UTC, its result, the app, and a description.
With --json: an array of {time, identifier, success, scenario, step, party, phase, description}.

Examples:
  appsync history phone
  appsync history phone --json | jq '.[] | select(.success | not)')";

std::string timeText(const TransactionEntry& entry) {
  std::string text;
  appendTime(text, entry.time);
  return text;
}

Json toJson(const TransactionEntry& entry) {
  return {{"time", timeText(entry)},
          {"identifier", entry.bundleIdentifier},
          {"success", entry.success},
          {"scenario", entry.scenario ? Json(*entry.scenario) : Json(nullptr)},
          {"step", entry.step},
          {"party", entry.party ? Json(static_cast<std::uint32_t>(*entry.party)) : Json(nullptr)},
          {"phase", entry.phase ? Json(static_cast<std::uint32_t>(*entry.phase)) : Json(nullptr)},
          {"description", entry.description}};
}

std::string eventText(const TransactionEntry& entry) {
  if (entry.scenario) return *entry.scenario + ": " + entry.description;
  const std::string step(device::nameOf(static_cast<platform::TransactionStep>(entry.step)));
  const bool begins = entry.phase == platform::TransactionPhase::begin;
  return step + (begins ? " begins" : " ends") + (entry.description.empty() ? "" : ": " + entry.description);
}

void writeLineFor(StandardOutput& output, const TransactionEntry& entry) {
  output.writeLine(timeText(entry) + "  " + (entry.success ? "ok     " : "FAILED ") +
                   fitted(entry.bundleIdentifier, 32) + "  " + printable(eventText(entry)));
}

ExitStatus run(const HistoryOptions& options, device::Device& device) {
  const auto entries = device.services().transactionLog().entries();
  if (!entries) return reportUnusable(entries.error());
  StandardOutput output;
  Json list = Json::array();
  for (const TransactionEntry& entry : *entries) {
    options.json ? list.push_back(toJson(entry)) : writeLineFor(output, entry);
  }
  if (options.json) output.writeLine(indented(list));
  if (!options.json && entries->empty()) output.writeLine("No installs or removals yet.");
  return output.finish(ExitStatus::done);
}

}  // namespace

void addHistoryCommand(CLI::App& line, Invocation& invocation) {
  addListingCommand(line, invocation, {"history", "Show the log of installs and removals.", kExamples}, run);
}

}  // namespace appsync::cli
