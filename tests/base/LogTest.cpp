#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "base/Log.h"

namespace appsync::test {
namespace {

class RecordingCategory final : public LogCategory {
 public:
  bool isEnabled(LogLevel level) const noexcept override { return level == enabled; }
  void write(LogLevel level, std::string_view message) override { lines.emplace_back(level, message); }

  LogLevel enabled = LogLevel::standard;
  std::vector<std::pair<LogLevel, std::string>> lines;
};

/// Counts how often it is printed.
struct Countdown {
  std::string description() const { return std::to_string(++printed); }
  mutable int printed = 0;
};

TEST(Log, WritesTheWholeMessageWithItsLevel) {
  RecordingCategory category;
  log(category, LogLevel::standard, "%s|sync ended with success: %c", "com.a", true);
  EXPECT_EQ(category.lines,
            (std::vector{std::pair{LogLevel::standard, std::string("com.a|sync ended with success: y")}}));
}

TEST(Log, TakesMessagesWithoutArguments) {
  RecordingCategory category;
  log(category, LogLevel::standard, "Nothing to do");
  EXPECT_EQ(category.lines.at(0).second, "Nothing to do");
}

TEST(Log, FormatsNothingWhenTheLevelIsOff) {
  RecordingCategory category;
  const Countdown countdown;
  log(category, LogLevel::error, "%{public}@", countdown);
  EXPECT_EQ(countdown.printed, 0);
  EXPECT_TRUE(category.lines.empty());
  category.enabled = LogLevel::error;
  log(category, LogLevel::error, "%{public}@", countdown);
  EXPECT_EQ(countdown.printed, 1);
  EXPECT_EQ(category.lines.at(0), (std::pair{LogLevel::error, std::string("1")}));
}

}  // namespace
}  // namespace appsync::test
