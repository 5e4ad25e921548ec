// Options and reporters of commands that process many apps.
#pragma once

#include <memory>
#include <string>

#include <CLI/CLI.hpp>

#include "cli/Reporters.h"
#include "cli/StandardOutput.h"
#include "device/Device.h"

namespace appsync::cli {

struct ReportOptions {
  bool json = false;
  std::string log;
};

/// Adds --json and --log.
void addReportOptions(CLI::App& command, ReportOptions& options);

/// Returns the reporter for JSON Lines if requested, else the one for a terminal with cursor movement or for plain
/// lines.
[[nodiscard]] std::unique_ptr<host::SyncReporter> makeReporter(const ReportOptions& options, StandardOutput& output,
                                                               host::OperationKind operation);

/// Starts the sync framework's log if a file was given. Fails if the file cannot be opened.
[[nodiscard]] Status openLog(const ReportOptions& options, device::Device& device);

}  // namespace appsync::cli
