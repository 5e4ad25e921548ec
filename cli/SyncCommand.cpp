#include <algorithm>
#include <memory>
#include <utility>
#include <vector>

#include "cli/Commands.h"
#include "cli/DeviceCommand.h"
#include "cli/Printable.h"
#include "cli/ReportOptions.h"
#include "cli/StandardOutput.h"
#include "daemon/ClientModule.h"
#include "daemon/Daemon.h"

namespace appsync::cli {
namespace {

struct SyncOptions {
  std::string device;
  std::string library;
  std::vector<std::string> remove;
  std::vector<std::string> only;
  ReportOptions report;
};

constexpr const char* kExamples =
    R"(LIBRARY is a folder of packages: files named *.zip, created by `appsync pack`. Of two versions of an app the newer is
used. The sync installs missing apps and updates older ones. A failed app does not stop the others.

An app that was deleted on the device, or removed with --remove, is not sent again unless --only names it.
Ctrl-C ends the sync in order; the next sync offers the interrupted apps again. A second Ctrl-C ends it at once.
While it runs, `appsync tap` has it send an app before the others, and `appsync cancel` has it skip one.

With --json each line is an object: {"event":"progress","identifier":...,"fraction":...}; exactly one of
installed, updated, removed, failed and skipped for each app, the last two with a "reason"; {"event":"waiting",...}
while the home screen does not release an app; and at the end {"event":"summary",...} with the identifiers as
arrays.

Examples:
  appsync sync phone lib
  appsync sync phone lib --only org.example.tides
  appsync sync phone lib --remove org.example.tides --log sync.log
  appsync sync phone lib --json | jq -c 'select(.event == "failed")'

Exit status: 0 done, 1 some app failed, 2 wrong usage, 3 the device or library cannot be used.)";

bool isUsable(const SyncOptions& options) {
  for (const auto& [option, identifiers] :
       {std::pair("--remove", &options.remove), std::pair("--only", &options.only)}) {
    for (const std::string& identifier : *identifiers) {
      if (!identifier.empty() && isUTF8(identifier)) continue;
      printError(identifier.empty() ? std::string("the app identifier after ") + option + " is empty; name an app"
                                    : "an app identifier must be text in UTF-8, not \"" + identifier + "\"");
      return false;
    }
  }
  for (const std::string& identifier : options.remove) {
    if (std::ranges::find(options.only, identifier) == options.only.end()) continue;
    printError(identifier + " is given to both --remove and --only; use one of them");
    return false;
  }
  return true;
}

ExitStatus run(const SyncOptions& options, device::Device& device) {
  if (Status opened = openLog(options.report, device); !opened) return reportUnusable(opened.error());
  const Result<host::Library> library = host::readLibrary(options.library);
  if (!library) return reportUnusable(library.error());
  const auto client = daemon::makeClient(device.platform());
  if (!client) return reportUnusable(client.error());
  const host::InterruptSignals interruption;
  StandardOutput output;
  const auto reporter = makeReporter(options.report, output, host::OperationKind::sync);
  host::SyncProgress progress(*reporter);
  daemon::Daemon daemon(device, **client, progress, interruption);
  const Status synced = daemon.sync(
      {*library, {options.only.begin(), options.only.end()}, {options.remove.begin(), options.remove.end()}});
  const host::AppOutcomes& outcomes = progress.summarise();
  if (!synced) return output.finish(reportUnusable(synced.error()));
  const bool isSuccessful =
      std::ranges::none_of(outcomes, [](const host::AppOutcome& one) { return host::isFailure(one.event); });
  return output.finish(isSuccessful ? ExitStatus::done : ExitStatus::someAppFailed);
}

}  // namespace

void addSyncCommand(CLI::App& line, Invocation& invocation) {
  const auto options = std::make_shared<SyncOptions>();
  CLI::App* command = line.add_subcommand("sync", "Sync the apps on a device with a library.");
  addDevice(*command, options->device);
  command->add_option("LIBRARY", options->library, "a folder of packages")->required();
  command->add_option("--remove", options->remove, "remove this app from the device")->type_name("ID")->take_all();
  command->add_option("--only", options->only, "install or update this app only, even if it was deleted before")
      ->type_name("ID");
  addReportOptions(*command, options->report);
  command->footer(kExamples);
  command->callback([options, &invocation] {
    invocation = [options] {
      if (!isUsable(*options)) return ExitStatus::wrongUsage;
      return withDevice(options->device, device::Access::exclusive,
                        [&](device::Device& device) { return run(*options, device); });
    };
  });
}

}  // namespace appsync::cli
