// Calls and messages in one order.
#pragma once

#include <string_view>

#include "kit/fakes/FakePlatform.h"
#include "kit/fakes/RecordingLog.h"

namespace appsync::test {

/// From now on every call of a fake stands in the platform's log too, in its place among the messages. Takes the
/// journal's hook.
void logCalls(FakePlatform& platform);

/// The line of such a call: `called("fileSystem.readFile /a")`.
[[nodiscard]] LogLine called(std::string_view line);

}  // namespace appsync::test
