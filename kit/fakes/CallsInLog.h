// Records calls and log messages in one order.
#pragma once

#include <string_view>

#include "kit/fakes/FakePlatform.h"
#include "kit/fakes/RecordingLog.h"

namespace appsync::test {

/// Adds each later call of a fake to the platform's log, in order with the messages. Replaces the journal's hook.
void logCalls(FakePlatform& platform);

/// Returns the log line of a call: `called("fileSystem.readFile /a")`.
[[nodiscard]] LogLine called(std::string_view line);

}  // namespace appsync::test
