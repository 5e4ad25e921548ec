// The commands of the tool. Each function adds a command with its options and its help to the command line. Parsing
// sets `invocation` to the function that runs the given command.
#pragma once

#include <functional>

#include "cli/ExitStatus.h"

namespace CLI {
class App;
}

namespace appsync::cli {

using Invocation = std::function<ExitStatus()>;

void addInitCommand(CLI::App& line, Invocation& invocation);
void addPackCommand(CLI::App& line, Invocation& invocation);
void addSyncCommand(CLI::App& line, Invocation& invocation);
void addBackupCommand(CLI::App& line, Invocation& invocation);
void addRestoreCommand(CLI::App& line, Invocation& invocation);
void addTapCommand(CLI::App& line, Invocation& invocation);
void addCancelCommand(CLI::App& line, Invocation& invocation);
void addAppsCommand(CLI::App& line, Invocation& invocation);
void addReportCommand(CLI::App& line, Invocation& invocation);
void addScreenCommand(CLI::App& line, Invocation& invocation);
void addHistoryCommand(CLI::App& line, Invocation& invocation);
void addSetCommand(CLI::App& line, Invocation& invocation);
void addClearCommand(CLI::App& line, Invocation& invocation);
void addPlistCommand(CLI::App& line, Invocation& invocation);

}  // namespace appsync::cli
