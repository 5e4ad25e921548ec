#include "cli/CommandLine.h"

#include <string>
#include <string_view>

#include <CLI/CLI.hpp>

#include "cli/Commands.h"
#include "cli/StandardOutput.h"

namespace appsync::cli {
namespace {

constexpr const char* kNameAndVersion = "appsync " APPSYNC_VERSION;

constexpr const char* kPurpose = R"(appsync keeps the apps on a device in step with a folder of app packages.

A device is a directory of this machine. `init` makes one, `pack` turns an app's folder into a package, and `sync` installs
and updates what the library holds, and removes what you ask it to. `backup` and `restore` bring the apps of one device to
a new one.)";

constexpr const char* kExamples = R"(Examples:
  appsync init phone                    make a device
  appsync pack Tides.app -o lib/tides.zip
  appsync sync phone lib                install and update everything in lib
  appsync sync phone lib --remove org.example.tides
  appsync tap phone org.example.tides   while a sync runs: this app before the others
  appsync backup phone phone-backup     what its apps need to come back
  appsync restore new-phone phone-backup
  appsync apps phone                    what is on it now
  appsync report phone                  how many they are, and whose
  appsync screen phone -o screen.png    what its home screen looks like

Exit status: 0 done, 1 some app failed, 2 wrong usage, 3 the device, library, backup, file or plug-in cannot be used.
Environment: APPSYNC_MODULE is the file of the plug-in to load, instead of the one installed with this program.
`appsync COMMAND --help` tells more about a command.)";

void addCommands(CLI::App& line, Invocation& invocation) {
  addInitCommand(line, invocation);
  addPackCommand(line, invocation);
  addSyncCommand(line, invocation);
  addBackupCommand(line, invocation);
  addRestoreCommand(line, invocation);
  addTapCommand(line, invocation);
  addCancelCommand(line, invocation);
  addAppsCommand(line, invocation);
  addReportCommand(line, invocation);
  addScreenCommand(line, invocation);
  addHistoryCommand(line, invocation);
  addSetCommand(line, invocation);
  addClearCommand(line, invocation);
  addPlistCommand(line, invocation);
}

bool isCommand(const CLI::App& line, const std::string& word) {
  return !line.get_subcommands([&](const CLI::App* command) { return command->get_name() == word; }).empty();
}

/// The command that was recognised before parsing went wrong, for the hint at its help.
std::string namedCommand(const CLI::App& line) {
  const auto named = line.get_subcommands();
  return named.empty() ? std::string("appsync") : "appsync " + named.front()->get_name();
}

ExitStatus explain(const CLI::App& line, const CLI::ParseError& error) {
  std::string reason = error.what();
  while (!reason.empty() && (reason.back() == '.' || reason.back() == '\n'))
    reason.pop_back();
  printError(reason + "; `" + namedCommand(line) + " --help` shows how it is used");
  return ExitStatus::wrongUsage;
}

ExitStatus show(std::string_view text) {
  StandardOutput output;
  output.write(text);
  return output.finish(ExitStatus::done);
}

ExitStatus showHelp(const CLI::App& line) {
  const auto named = line.get_subcommands();
  return show(named.empty() ? line.help() : named.front()->help(line.get_name()));
}

}  // namespace

ExitStatus runCommandLine(int count, const char* const* words) {
  CLI::App line(kPurpose, "appsync");
  line.footer(kExamples);
  line.set_version_flag("--version", kNameAndVersion, "Print the name and the version and exit");
  line.require_subcommand(1);
  line.get_formatter()->column_width(34);
  Invocation invocation;
  addCommands(line, invocation);
  if (count <= 1) {
    printError("a command is missing; `appsync --help` shows them");
    return ExitStatus::wrongUsage;
  }
  if (const std::string first = words[1]; !first.starts_with('-') && !isCommand(line, first)) {
    printError("there is no command \"" + first + "\"; `appsync --help` shows them");
    return ExitStatus::wrongUsage;
  }
  try {
    line.parse(count, words);
  } catch (const CLI::CallForHelp&) {
    return showHelp(line);
  } catch (const CLI::CallForVersion&) {
    return show(std::string(kNameAndVersion) + "\n");
  } catch (const CLI::ParseError& error) {
    return explain(line, error);
  }
  return invocation();
}

}  // namespace appsync::cli
