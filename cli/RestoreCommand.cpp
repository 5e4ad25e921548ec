#include <algorithm>
#include <memory>
#include <string>

#include "cli/Commands.h"
#include "cli/DeviceCommand.h"
#include "cli/ReportOptions.h"
#include "cli/StandardOutput.h"
#include "daemon/ClientModule.h"
#include "host/Backup.h"
#include "host/Restore.h"

namespace appsync::cli {
namespace {

struct RestoreOptions {
  std::string device;
  std::string backup;
  ReportOptions report;
};

constexpr const char* kExamples =
    R"(BACKUP is a folder that `appsync backup` made. DEVICE must have no apps yet. Each app of the backup gets a placeholder
on it, with its name, version and icon; its data is kept for it. Then

  appsync sync DEVICE LIBRARY

brings the packages of those that are not demoted: from the library, or where apps are installed through
coordinators from the folder that was set with `appsync set DEVICE store=FOLDER`.

A restore that was cut off is completed by running it again. One bad app does not stop the others.

With --json each line is an object: {"event":"progress","identifier":...,"fraction":...} while placeholders arrive;
exactly one of restored, failed and skipped for each app, the last two with a "reason"; and at the end
{"event":"summary",...} with the identifiers as arrays.

Examples:
  appsync init new-phone --coordinated
  appsync set new-phone store=lib
  appsync restore new-phone phone-backup
  appsync sync new-phone lib

Exit status: 0 done, 1 some app failed, 2 wrong usage, 3 the device or backup cannot be used.)";

ExitStatus run(const RestoreOptions& options, device::Device& device) {
  if (Status opened = openLog(options.report, device); !opened) return reportUnusable(opened.error());
  const Result<host::Backup> backup = host::readBackup(options.backup);
  if (!backup) return reportUnusable(backup.error());
  // Not the daemon: outside it the plug-in itself waits until the placeholders are there.
  device.services().bundles().actAs(std::string(device::Bundles::kDataMigratorIdentifier));
  const auto client = daemon::makeClient(device.platform());
  if (!client) return reportUnusable(client.error());
  StandardOutput output;
  const auto reporter = makeReporter(options.report, output, host::Course::restore);
  host::SyncProgress progress(*reporter);
  host::Restore restore(device, *backup, **client, progress);
  if (Status checked = restore.check(); !checked) return reportUnusable(checked.error());
  const Status restored = restore.run();
  const host::AppOutcomes& outcomes = progress.summarise();
  if (!restored) return output.finish(reportUnusable(restored.error()));
  const bool allWell =
      std::ranges::none_of(outcomes, [](const host::AppOutcome& one) { return host::isFailure(one.event); });
  return output.finish(allWell ? ExitStatus::done : ExitStatus::someAppFailed);
}

}  // namespace

void addRestoreCommand(CLI::App& line, Invocation& invocation) {
  const CommandText text = {"restore", "Bring the apps of a backup back to a new device.", kExamples};
  const auto added = addDeviceCommand(line, invocation, text, device::Access::exclusive, run);
  added.command.add_option("BACKUP", added.options->backup, "the backup's folder")->required();
  addReportOptions(added.command, added.options->report);
}

}  // namespace appsync::cli
