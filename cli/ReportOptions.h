// How commands that work on many apps tell of it.
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

/// JSON Lines if they are asked for, else lines for a terminal that can write over them, or for a pipe.
[[nodiscard]] std::unique_ptr<host::SyncReporter> makeReporter(const ReportOptions& options, StandardOutput& output,
                                                               host::Course course);

/// Lets the sync framework log to the file, if one is asked for.
[[nodiscard]] Status openLog(const ReportOptions& options, device::Device& device);

}  // namespace appsync::cli
