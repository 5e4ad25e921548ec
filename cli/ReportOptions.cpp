#include "cli/ReportOptions.h"

#include <cstdlib>
#include <string_view>
#include <utility>

#include <unistd.h>

#include "device/services/LogSink.h"

namespace appsync::cli {

void addReportOptions(CLI::App& command, ReportOptions& options) {
  command.add_flag("--json", options.json, "write JSON Lines");
  command.add_option("--log", options.log, "append the sync framework's log to this file")->type_name("FILE");
}

namespace {

/// Returns whether standard output is a terminal with cursor movement.
bool canMoveCursor() {
  const char* terminal = std::getenv("TERM");
  const std::string_view kind = terminal == nullptr ? "" : terminal;
  return ::isatty(STDOUT_FILENO) == 1 && !kind.empty() && kind != "dumb";
}

}  // namespace

std::unique_ptr<host::SyncReporter> makeReporter(const ReportOptions& options, StandardOutput& output,
                                                 host::OperationKind operation) {
  if (options.json) return makeJsonReporter(output, operation);
  return canMoveCursor() ? makeTerminalReporter(output) : makePlainReporter(output);
}

Status openLog(const ReportOptions& options, device::Device& device) {
  if (options.log.empty()) return {};
  auto sink = device::FileLogSink::open(options.log);
  if (!sink) return sink.error();
  device.services().syncFramework().logTo(std::move(sink).value());
  return {};
}

}  // namespace appsync::cli
