// Reporters of a sync or restore: plain lines, progress on a terminal, or JSON.
#pragma once

#include <memory>
#include <string_view>

#include "cli/StandardOutput.h"
#include "host/SyncReporter.h"

namespace appsync::cli {

/// The message when the user interrupts a sync.
inline constexpr std::string_view kInterruptedNotice =
    "interrupted; finishing the installs of sent packages. Interrupt again to stop at once";

/// Returns the reporter for pipes: one line for each app that changed, failed or was skipped, and a summary.
[[nodiscard]] std::unique_ptr<host::SyncReporter> makePlainReporter(StandardOutput& output);
/// Returns the reporter for terminals: the same lines and, redrawn below them, the progress of each app and of the
/// sync.
[[nodiscard]] std::unique_ptr<host::SyncReporter> makeTerminalReporter(StandardOutput& output);
/// Returns the reporter for JSON Lines.
[[nodiscard]] std::unique_ptr<host::SyncReporter> makeJsonReporter(StandardOutput& output,
                                                                   host::OperationKind operation);

}  // namespace appsync::cli
