#include "kit/fakes/CallsInLog.h"

#include <optional>
#include <string>

namespace appsync::test {

namespace {

/// A category that the plug-in does not use.
constexpr int kCallCategory = 99;

}  // namespace

void logCalls(FakePlatform& platform) {
  LogCategory& calls = platform.log.category(kCallCategory);
  platform.journal.setHook([&calls](std::string_view operation, std::string_view arguments) -> std::optional<Error> {
    std::string line(operation);
    if (!arguments.empty()) line.append(" ").append(arguments);
    calls.write(LogLevel::standard, line);
    return std::nullopt;
  });
}

LogLine called(std::string_view line) {
  return {kCallCategory, LogLevel::standard, std::string(line)};
}

}  // namespace appsync::test
