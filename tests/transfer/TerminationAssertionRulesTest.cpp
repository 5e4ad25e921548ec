// What an install does on each answer of the home screen.
#include <cstdint>
#include <vector>

#include <gtest/gtest.h>

#include "transfer/TerminationAssertionRules.h"

namespace appsync::test {
namespace {

using platform::TerminationAssertionOutcome;

void expectRule(std::uint8_t code, AssertionAction action, bool isSuccess, std::string_view description) {
  const AssertionRule rule = assertionRule(TerminationAssertionOutcome{code});
  EXPECT_EQ(rule.outcome, TerminationAssertionOutcome{code});
  EXPECT_EQ(rule.action, action);
  EXPECT_EQ(rule.isSuccess, isSuccess);
  EXPECT_EQ(rule.description, description);
}

TEST(TerminationAssertionRules, AGrantedAssertionLetsTheInstallGoAhead) {
  expectRule(0, AssertionAction::install, true, "assertion succeeded");
}

TEST(TerminationAssertionRules, ADenialWaitsAndIsToldAsASuccess) {
  expectRule(1, AssertionAction::retryLater, true, "assertion denied");
}

TEST(TerminationAssertionRules, AnUnknownAppIsInstalled) {
  expectRule(2, AssertionAction::install, true, "assertion not found");
}

TEST(TerminationAssertionRules, EveryOtherAnswerFails) {
  for (int code = 3; code <= 255; ++code) {
    expectRule(static_cast<std::uint8_t>(code), AssertionAction::fail, false, "unknown error grabbing assertion");
  }
}

}  // namespace
}  // namespace appsync::test
