#include <gtest/gtest-spi.h>
#include <gtest/gtest.h>

#include "kit/fakes/FakeHomeScreen.h"

namespace appsync::test {
namespace {

using Lines = std::vector<std::string>;
using platform::TerminationAssertion;
using platform::TerminationAssertionOutcome;

class FakeHomeScreenTest : public testing::Test {
 protected:
  /// Returns the outcome of the next request and whether it created an assertion: "1 none", "0 made".
  std::string ask(std::string_view identifier) {
    TerminationAssertionOutcome outcome{};
    const auto assertion = screen.terminationAssertionCreate(identifier, 0, outcome);
    return std::to_string(static_cast<int>(outcome)) + (assertion ? " made" : " none");
  }

  CallJournal journal;
  FakeHomeScreen screen{journal};
};

TEST_F(FakeHomeScreenTest, GrantsByDefault) {
  EXPECT_EQ(ask("com.a"), "0 made");
}

TEST_F(FakeHomeScreenTest, GivesScriptedAnswersThenTheDefault) {
  screen.answerAlways("com.a", AssertionAnswer::notFound());
  screen.answerNext("com.a", {AssertionAnswer::denied(),
                              AssertionAnswer::without(3),
                              {TerminationAssertionOutcome::notFound, AssertionAnswer::Object::made},
                              AssertionAnswer::without(0)});
  EXPECT_EQ(ask("com.a"), "1 none");
  EXPECT_EQ(ask("com.b"), "0 made");
  EXPECT_EQ(ask("com.a"), "3 none");
  EXPECT_EQ(ask("com.a"), "2 made");
  EXPECT_EQ(ask("com.a"), "0 none");
  EXPECT_EQ(ask("com.a"), "2 none");
}

TEST_F(FakeHomeScreenTest, JournalsTheReleaseOfAnAssertion) {
  TerminationAssertionOutcome outcome{};
  auto assertion = screen.terminationAssertionCreate("com.a", 0, outcome);
  EXPECT_EQ(screen.held(), std::multiset<std::string>{"com.a"});
  assertion.reset();
  EXPECT_EQ(screen.held(), std::multiset<std::string>());
  EXPECT_EQ(journal.lines(), (Lines{"homeScreen.terminationAssertionCreate com.a", "homeScreen.release com.a"}));
}

TEST_F(FakeHomeScreenTest, RecordsLayouts) {
  screen.setIconState(screen.blockableServerPort(), bytesOf("first"));
  screen.setIconState(screen.blockableServerPort(), bytesOf("second"));
  EXPECT_EQ(screen.iconStates(), (Lines{"first", "second"}));
}

TEST_F(FakeHomeScreenTest, HasNoOrderByDefault) {
  EXPECT_EQ(screen.getFlattenedIconState(screen.blockableServerPort(), 1), std::nullopt);
}

TEST_F(FakeHomeScreenTest, FailedCallReturnsAnUnknownCode) {
  journal.failCall(1, Error{});
  EXPECT_EQ(ask("com.a"), "255 none");
}

TEST_F(FakeHomeScreenTest, MisuseFailsTheTest) {
  TerminationAssertionOutcome outcome{};
  EXPECT_NONFATAL_FAILURE(screen.setIconState(7, {}), "no such port");
  EXPECT_NONFATAL_FAILURE(static_cast<void>(screen.getFlattenedIconState(screen.blockableServerPort(), 2)), "format 1");
  EXPECT_NONFATAL_FAILURE(static_cast<void>(screen.terminationAssertionCreate("com.a", 1, outcome)), "always 0");
}

}  // namespace
}  // namespace appsync::test
