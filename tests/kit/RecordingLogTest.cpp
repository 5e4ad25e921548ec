#include <gtest/gtest.h>

#include "kit/fakes/RecordingLog.h"
#include "kit/fakes/TextDiff.h"

namespace appsync::test {
namespace {

using Lines = std::vector<std::string>;

TEST(RecordingLog, RecordsAllCategoriesInOneOrder) {
  RecordingLog log;
  log.category(8).write(LogLevel::standard, "com.corvel.qor.Zephtra.AppSync|first");
  log.category(14).write(LogLevel::standard, "com.corvel.qor.Zephtra.AppSync|second");
  log.category(8).write(LogLevel::error, "com.corvel.qor.Zephtra.AppSync|third");
  EXPECT_EQ(log.lines(), (LogLines{logged("first"), loggedIn(14, "second"), loggedError("third")}));
  EXPECT_EQ(log.lines(8), (LogLines{logged("first"), loggedError("third")}));
  EXPECT_EQ(log.messages(), (Lines{"first", "second", "third"}));
  EXPECT_EQ(log.messages(14), Lines{"second"});
  EXPECT_TRUE(log.contains(logged("first")));
  EXPECT_FALSE(log.contains(loggedError("first")));
}

TEST(RecordingLog, DistinguishesLinesWithoutTheIdentifier) {
  RecordingLog log;
  log.category(8).write(LogLevel::standard, "first");
  EXPECT_FALSE(log.contains(logged("first")));
}

TEST(RecordingLog, EnablesAllCategoriesByDefault) {
  RecordingLog log;
  LogCategory& category = log.category(8);
  EXPECT_TRUE(category.isEnabled(LogLevel::standard));
  log.disable(8, LogLevel::standard);
  EXPECT_FALSE(category.isEnabled(LogLevel::standard));
  EXPECT_TRUE(category.isEnabled(LogLevel::error));
  EXPECT_TRUE(log.category(14).isEnabled(LogLevel::standard));
  log.enable(8, LogLevel::standard);
  EXPECT_TRUE(category.isEnabled(LogLevel::standard));
}

TEST(RecordingLog, ClearsItsLines) {
  RecordingLog log;
  log.category(8).write(LogLevel::standard, "first");
  log.clear();
  EXPECT_EQ(log.lines(), LogLines());
}

TEST(RecordingLog, ComparisonShowsDifferences) {
  EXPECT_TRUE(sameLines(LogLines{logged("a")}, LogLines{logged("a")}));
  const testing::AssertionResult result = sameLines(LogLines{logged("a"), loggedError("b")}, LogLines{logged("a")});
  EXPECT_FALSE(result);
  EXPECT_STREQ(result.message(),
               "- expected, + actual\n"
               "  [8] com.corvel.qor.Zephtra.AppSync|a\n"
               "- [8 error] com.corvel.qor.Zephtra.AppSync|b\n");
}

TEST(SameLines, ShowsMissingAndUnexpectedLinesInOrder) {
  const testing::AssertionResult result = sameLines(Lines{"a", "b", "c", "d"}, Lines{"a", "x", "c", "y", "d"});
  EXPECT_FALSE(result);
  EXPECT_STREQ(result.message(), "- expected, + actual\n  a\n- b\n+ x\n  c\n+ y\n  d\n");
}

TEST(SameLines, SucceedsForEqualLists) {
  EXPECT_TRUE(sameLines(Lines{}, Lines{}));
  EXPECT_TRUE(sameLines(Lines{"a", "a"}, Lines{"a", "a"}));
  EXPECT_FALSE(sameLines(Lines{"a", "a"}, Lines{"a"}));
}

}  // namespace
}  // namespace appsync::test
