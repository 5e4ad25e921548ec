#include <algorithm>
#include <string>

#include "cli/Commands.h"
#include "cli/DeviceCommand.h"
#include "cli/Printable.h"
#include "cli/StandardOutput.h"
#include "daemon/ClientModule.h"
#include "device/apps/Demotion.h"
#include "host/BackupWriter.h"

namespace appsync::cli {
namespace {

struct BackupOptions {
  std::string device;
  std::string backup;
};

constexpr const char* kExamples =
    R"(BACKUP is the folder to create; it must not exist yet. It receives each app's store metadata, licence, icon, version
and data, the list of demoted apps, and the order of the icons. It has no packages: after `appsync restore` the next
sync sends them.

Items of an app's data that are not files, folders or links are omitted, with a message on standard error.

The folder is created atomically: a backup that fails or is interrupted leaves nothing behind.

Example:
  appsync backup phone phone-backup

Exit status: 0 done, 2 wrong usage, 3 the device cannot be used or the backup cannot be written.)";

std::string summaryOf(const host::Backup& backup) {
  const auto count = [&](auto&& has) { return std::to_string(std::ranges::count_if(backup.apps, has)); };
  return "Saved " + std::to_string(backup.apps.size()) + (backup.apps.size() == 1 ? " app" : " apps") + ", " +
         count([](const host::BackedUpApp& app) { return app.isDemoted(); }) + " demoted, " +
         count([](const host::BackedUpApp& app) { return app.data.has_value(); }) + " with data, to " +
         printable(backup.path) + ".";
}

void reportOmittedData(const host::Backup& backup) {
  for (const host::BackedUpApp& app : backup.apps) {
    if (app.leftOut == 0) continue;
    printError("the data of " + app.name.identifier + " is saved without " + std::to_string(app.leftOut) +
               (app.leftOut == 1 ? " item that is not a file, folder or link"
                                 : " items that are not files, folders or links"));
  }
}

ExitStatus run(const BackupOptions& options, device::Device& device) {
  const auto client = daemon::makeClient(device.platform());
  if (!client) return reportUnusable(client.error());
  (*client)->prepareForBackup();
  const Status listed = device::recordDemotedApps(device.services().defaultRegistry(), device.services().fileSystem());
  if (!listed) return reportUnusable(listed.error());
  const Result<host::Backup> backup = host::writeBackup(device, options.backup);
  if (!backup) return reportUnusable(backup.error());
  reportOmittedData(*backup);
  StandardOutput output;
  output.writeLine(summaryOf(*backup));
  return output.finish(ExitStatus::done);
}

}  // namespace

void addBackupCommand(CLI::App& line, Invocation& invocation) {
  const CommandText text = {"backup", "Back up the apps on a device.", kExamples};
  const auto added = addDeviceCommand(line, invocation, text, device::Access::exclusive, run);
  added.command.add_option("BACKUP", added.options->backup, "the folder to create")->required();
}

}  // namespace appsync::cli
