#include "cli/CommandLine.h"

#include <string>
#include <string_view>

#include <CLI/CLI.hpp>

#include "cli/Commands.h"
#include "cli/StandardOutput.h"

namespace appsync::cli {
namespace {

constexpr const char* kNameAndVersion = "appsync " APPSYNC_VERSION;

constexpr const char* kPurpose = R"(appsync syncs the apps on a device with a folder of app packages.

A device is a folder of this machine. `init` creates one, `pack` creates a package from an app's folder, and `sync`
installs and updates the apps of a library of packages and removes the apps that you name. `backup` and `restore` move
the apps of one device to a new one.)";

constexpr const char* kExamples = R"(Examples:
  appsync init phone                    create a device
  appsync pack Tides.app -o lib/tides.zip
  appsync sync phone lib                install and update everything in lib
  appsync sync phone lib --remove org.example.tides
  appsync tap phone org.example.tides   have the running sync send this app first
  appsync backup phone phone-backup     back up its apps
  appsync restore new-phone phone-backup
  appsync apps phone                    list its apps
  appsync report phone                  show their number, size and accounts
  appsync screen phone -o screen.png    draw its home screen

Exit status: 0 done, 1 some app failed, 2 wrong usage, 3 the device, library, backup, file or plug-in cannot be used.
Environment: APPSYNC_MODULE is the file of the plug-in to load, instead of the one installed with this program.
`appsync COMMAND --help` describes a command.)";

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

/// Returns the command that was recognised before parsing failed, for the hint at its help.
std::string namedCommand(const CLI::App& line) {
  const auto named = line.get_subcommands();
  return named.empty() ? std::string("appsync") : "appsync " + named.front()->get_name();
}

ExitStatus explain(const CLI::App& line, const CLI::ParseError& error) {
  std::string reason = error.what();
  while (!reason.empty() && (reason.back() == '.' || reason.back() == '\n'))
    reason.pop_back();
  printError(reason + "; `" + namedCommand(line) + " --help` describes its usage");
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
    printError("a command is missing; `appsync --help` lists the commands");
    return ExitStatus::wrongUsage;
  }
  if (const std::string first = words[1]; !first.starts_with('-') && !isCommand(line, first)) {
    printError("there is no command \"" + first + "\"; `appsync --help` lists the commands");
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
