// Commands to a sync that runs in another process.
#include <string>

#include "cli/Commands.h"
#include "cli/DeviceCommand.h"
#include "cli/StandardOutput.h"
#include "daemon/control/Client.h"
#include "device/packages/BundleIdentifier.h"

namespace appsync::cli {
namespace {

struct ControlOptions {
  std::string device;
  std::string identifier;
};

constexpr const char* kTapExamples =
    R"(Acts as a tap on the icon of an app that waits for its package: the running sync sends the package before all other
packages that it has not started to send. `appsync apps` shows which apps wait. A sync must be running on the device,
and the device must install through coordinators, which is the default of `appsync init`.

Examples:
  appsync sync phone lib &
  appsync tap phone org.example.tides

Exit status: 0 done, 1 the app is not being installed, 2 wrong usage, 3 no sync is running, or it cannot be reached.)";

constexpr const char* kCancelExamples =
    R"(Acts as the removal of an app from the home screen while it waits for its package: the sync cancels the transfer of
the package and reports the app as skipped. An installed app stays as it is; a cancelled update leaves the old version.
The next sync offers the app again. A sync must be running on the device, and the device must install through
coordinators, which is the default of `appsync init`.

Examples:
  appsync sync phone lib &
  appsync cancel phone org.example.tides

Exit status: 0 done, 1 the app is not being installed or cannot be cancelled any more, 2 wrong usage,
3 no sync is running, or it cannot be reached.)";

ExitStatus ask(daemon::ControlVerb verb, const ControlOptions& options, device::Device& device) {
  if (!device::isBundleIdentifier(options.identifier)) {
    printError("\"" + options.identifier + "\" is not an app identifier; `appsync apps` lists those of a device");
    return ExitStatus::wrongUsage;
  }
  if (!device.platform().installCoordination().coordinationIsEnabled()) {
    printError(options.device +
               " installs directly, so its apps cannot be prioritised or cancelled; run `appsync set " +
               options.device + " coordination=on` to have later syncs install through coordinators");
    return ExitStatus::unusable;
  }
  const Result<daemon::ControlAnswer> answer = daemon::askSync(options.device, {verb, options.identifier});
  if (!answer) return reportUnusable(answer.error());
  if (answer->result != daemon::ControlResult::done) {
    printError(answer->why);
    return answer->result == daemon::ControlResult::refused ? ExitStatus::someAppFailed : ExitStatus::unusable;
  }
  StandardOutput output;
  output.writeLine(options.identifier +
                   (verb == daemon::ControlVerb::cancel ? " is cancelled." : " is sent before the others."));
  return output.finish(ExitStatus::done);
}

template <daemon::ControlVerb kVerb>
ExitStatus run(const ControlOptions& options, device::Device& device) {
  return ask(kVerb, options, device);
}

void addControlCommand(CLI::App& line, Invocation& invocation, const CommandText& text,
                       ExitStatus (*run)(const ControlOptions&, device::Device&)) {
  const auto added = addDeviceCommand(line, invocation, text, device::Access::readOnly, run);
  added.command.add_option("ID", added.options->identifier, "the app's identifier")->required();
}

}  // namespace

void addTapCommand(CLI::App& line, Invocation& invocation) {
  addControlCommand(line, invocation, {"tap", "Have a running sync send an app before the others.", kTapExamples},
                    run<daemon::ControlVerb::prioritize>);
}

void addCancelCommand(CLI::App& line, Invocation& invocation) {
  addControlCommand(line, invocation, {"cancel", "Have a running sync skip an app.", kCancelExamples},
                    run<daemon::ControlVerb::cancel>);
}

}  // namespace appsync::cli
