#include <algorithm>
#include <memory>
#include <string>

#include "cli/Commands.h"
#include "cli/DeviceCommand.h"
#include "cli/ReportOptions.h"
#include "cli/StandardOutput.h"
#include "daemon/DataMigrator.h"
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
    R"(BACKUP is a folder that `appsync backup` created. DEVICE must have no apps. The restore creates a placeholder for each
app of the backup, with its name, version and icon, and keeps its data until it is installed. Then

  appsync sync DEVICE LIBRARY

installs the apps that are not demoted: from the library or, on a device that installs through coordinators, from the
folder that was set with `appsync set DEVICE store=FOLDER`.

Run an interrupted restore again to complete it. A failed app does not stop the others.

With --json each line is an object: {"event":"progress","identifier":...,"fraction":...} while placeholders are created;
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
  Result<daemon::DataMigrator> migrator = daemon::DataMigrator::make(device);
  if (!migrator) return reportUnusable(migrator.error());
  StandardOutput output;
  const auto reporter = makeReporter(options.report, output, host::OperationKind::restore);
  host::SyncProgress progress(*reporter);
  host::Restore restore(device, *backup, progress);
  if (Status checked = restore.check(); !checked) return reportUnusable(checked.error());
  Status restored = restore.begin();
  if (restored) {
    migrator->createPlaceholders(*backup, restore.preparedApps(), progress);
    restored = restore.end();
  }
  const host::AppOutcomes& outcomes = progress.summarise();
  if (!restored) return output.finish(reportUnusable(restored.error()));
  const bool isSuccessful =
      std::ranges::none_of(outcomes, [](const host::AppOutcome& one) { return host::isFailure(one.event); });
  return output.finish(isSuccessful ? ExitStatus::done : ExitStatus::someAppFailed);
}

}  // namespace

void addRestoreCommand(CLI::App& line, Invocation& invocation) {
  const CommandText text = {"restore", "Restore the apps of a backup to a new device.", kExamples};
  const auto added = addDeviceCommand(line, invocation, text, device::Access::exclusive, run);
  added.command.add_option("BACKUP", added.options->backup, "the backup's folder")->required();
  addReportOptions(added.command, added.options->report);
}

}  // namespace appsync::cli
