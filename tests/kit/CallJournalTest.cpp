#include <atomic>

#include <gtest/gtest.h>

#include "kit/fakes/CallJournal.h"
#include "kit/fakes/Threads.h"

namespace appsync::test {
namespace {

using Lines = std::vector<std::string>;

const Error kFailure{"Test", 1, "injected", nullptr};

TEST(CallJournal, RecordsCallsAndNotesInOneOrder) {
  CallJournal journal;
  EXPECT_FALSE(journal.beforeCall("a.first", "x y"));
  journal.note("a.note z");
  EXPECT_FALSE(journal.beforeCall("b.second"));
  EXPECT_EQ(journal.lines(), (Lines{"a.first x y", "a.note z", "b.second"}));
  EXPECT_EQ(journal.callCount(), 2U);
}

TEST(CallJournal, FiltersLinesByPrefix) {
  CallJournal journal;
  for (const char* operation : {"a.first", "b.first", "a.second", "c.first"}) {
    EXPECT_FALSE(journal.beforeCall(operation));
  }
  EXPECT_EQ(journal.lines({"a.", "c."}), (Lines{"a.first", "a.second", "c.first"}));
  EXPECT_EQ(journal.count("a."), 2U);
  EXPECT_TRUE(journal.contains("b.first"));
  EXPECT_FALSE(journal.contains("b."));
}

TEST(CallJournal, ClearKeepsTheNumberOfCalls) {
  CallJournal journal;
  EXPECT_FALSE(journal.beforeCall("a.first"));
  journal.clear();
  EXPECT_EQ(journal.lines(), Lines());
  EXPECT_EQ(journal.callCount(), 1U);
}

TEST(CallJournal, HookRunsAfterTheCallIsRecorded) {
  CallJournal journal;
  journal.setHook([&](std::string_view operation, std::string_view arguments) -> std::optional<Error> {
    EXPECT_EQ(operation, "a.first");
    EXPECT_EQ(arguments, "x");
    EXPECT_TRUE(journal.contains("a.first x"));
    return kFailure;
  });
  EXPECT_EQ(journal.beforeCall("a.first", "x"), kFailure);
}

TEST(CallJournal, FailCallFailsOneCall) {
  CallJournal journal;
  EXPECT_FALSE(journal.beforeCall("before"));
  journal.failCall(2, kFailure);
  EXPECT_FALSE(journal.beforeCall("first"));
  EXPECT_EQ(journal.beforeCall("second"), kFailure);
  EXPECT_FALSE(journal.beforeCall("third"));
}

TEST(CallJournal, FailCallFailsOnOneThread) {
  CallJournal journal;
  journal.failCall(50, kFailure);
  std::atomic<int> failures = 0;
  runOnThreads(10, [&](std::size_t) {
    for (int round = 0; round < 10; ++round)
      failures += journal.beforeCall("a.call") ? 1 : 0;
  });
  EXPECT_EQ(failures, 1);
  EXPECT_EQ(journal.callCount(), 100U);
}

}  // namespace
}  // namespace appsync::test
