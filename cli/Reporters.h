// How a sync or restore is reported: plain lines, a terminal's progress, or JSON.
#pragma once

#include <memory>
#include <string_view>

#include "cli/StandardOutput.h"
#include "host/SyncReporter.h"

namespace appsync::cli {

/// What people are told when they interrupt a sync.
inline constexpr std::string_view kInterruptedNotice =
    "interrupted; finishing what was sent already. Interrupt again to end at once";

/// Plain lines for pipes: one for each app with which something happened, and a last one that counts.
[[nodiscard]] std::unique_ptr<host::SyncReporter> makePlainReporter(StandardOutput& output);
/// The same lines, and below them, redrawn in place, one per running app and one for the whole.
[[nodiscard]] std::unique_ptr<host::SyncReporter> makeTerminalReporter(StandardOutput& output);
/// JSON Lines for machines.
[[nodiscard]] std::unique_ptr<host::SyncReporter> makeJsonReporter(StandardOutput& output, host::Course course);

}  // namespace appsync::cli
