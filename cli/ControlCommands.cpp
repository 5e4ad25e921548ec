// What one may ask of a sync while it runs in another process.
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
    R"(Does what a tap on the app's icon does while it waits for its package: the package is sent before all others whose
turn has not come. `appsync apps` shows which apps wait. A sync must be running on the device at the time, in another
terminal perhaps, and the device must install through coordinators, as devices do unless they were made with --direct.

Examples:
  appsync sync phone lib &
  appsync tap phone org.example.tides

Exit status: 0 done, 1 the app is not on its way, 2 wrong usage, 3 no sync is running, or it cannot be reached.)";

constexpr const char* kCancelExamples =
    R"(Does what a person does who takes the app off the home screen while it waits for its package: the package is not
sent, or not to its end, and the sync tells the app as skipped. An app that is installed already stays as it is; an
update that is cancelled leaves the old version. The next sync offers the app again. A sync must be running on the
device at the time, and the device must install through coordinators, as devices do unless they were made with
--direct.

Examples:
  appsync sync phone lib &
  appsync cancel phone org.example.tides

Exit status: 0 done, 1 the app is not on its way, or is just being installed, 2 wrong usage, 3 no sync is running, or
it cannot be reached.)";

ExitStatus ask(daemon::ControlVerb verb, const ControlOptions& options, device::Device& device) {
  if (!device::isBundleIdentifier(options.identifier)) {
    printError("\"" + options.identifier + "\" is no app identifier; `appsync apps` shows those of a device");
    return ExitStatus::wrongUsage;
  }
  if (!device.platform().installCoordination().coordinationIsEnabled()) {
    printError(options.device + " installs directly, which can be neither hurried nor cancelled; `appsync set " +
               options.device + " coordination=on` has later syncs install through coordinators");
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
                   (verb == daemon::ControlVerb::cancel ? " is cancelled." : " comes before the others."));
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
  addControlCommand(line, invocation, {"tap", "Have a running sync bring an app before the others.", kTapExamples},
                    run<daemon::ControlVerb::prioritize>);
}

void addCancelCommand(CLI::App& line, Invocation& invocation) {
  addControlCommand(line, invocation, {"cancel", "Have a running sync leave an app out.", kCancelExamples},
                    run<daemon::ControlVerb::cancel>);
}

}  // namespace appsync::cli
