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
    R"(BACKUP is a folder that must not exist yet. It gets what the apps of the device need to come back: of each its store
metadata, licence, icon, version and data, which apps are demoted, and the order of the icons. Packages are not in
it: after `appsync restore` the next sync brings them.

What is neither file, folder nor link in an app's data is left out, and said so on standard error.

Whatever ends the process, the folder is whole or not there.

Example:
  appsync backup phone phone-backup

Exit status: 0 done, 2 wrong usage, 3 the device cannot be used or the backup not be written.)";

std::string summaryOf(const host::Backup& backup) {
  const auto count = [&](auto&& has) { return std::to_string(std::ranges::count_if(backup.apps, has)); };
  return "Saved " + std::to_string(backup.apps.size()) + (backup.apps.size() == 1 ? " app" : " apps") + ", " +
         count([](const host::BackedUpApp& app) { return app.isDemoted(); }) + " demoted, " +
         count([](const host::BackedUpApp& app) { return app.data.has_value(); }) + " with data, to " +
         printable(backup.path) + ".";
}

void tellWhatIsLeftOut(const host::Backup& backup) {
  for (const host::BackedUpApp& app : backup.apps) {
    if (app.leftOut == 0) continue;
    printError("the data of " + app.app.identifier + " is saved without " + std::to_string(app.leftOut) +
               (app.leftOut == 1 ? " item that is" : " items that are") + " neither file, folder nor link");
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
  tellWhatIsLeftOut(*backup);
  StandardOutput output;
  output.writeLine(summaryOf(*backup));
  return output.finish(ExitStatus::done);
}

}  // namespace

void addBackupCommand(CLI::App& line, Invocation& invocation) {
  const CommandText text = {"backup", "Save what a device's apps need to come back.", kExamples};
  const auto added = addDeviceCommand(line, invocation, text, device::Access::exclusive, run);
  added.command.add_option("BACKUP", added.options->backup, "the folder to make")->required();
}

}  // namespace appsync::cli
