// What an install does on each answer of the home screen.
#pragma once

#include <array>
#include <string_view>

#include "platform/HomeScreenService.h"

namespace appsync {

enum class AssertionAction { install, retryLater, fail };

/// One answer's meaning, and how the transaction log tells it. A denial is told as a success: the step did what it
/// should.
struct AssertionRule {
  platform::TerminationAssertionOutcome outcome;
  AssertionAction action;
  bool isSuccess;
  std::string_view description;
};

/// Every answer without a row of its own is an unknown failure.
[[nodiscard]] constexpr AssertionRule assertionRule(platform::TerminationAssertionOutcome outcome) {
  using platform::TerminationAssertionOutcome;
  constexpr std::array kRules{
      AssertionRule{TerminationAssertionOutcome::granted, AssertionAction::install, true, "assertion succeeded"},
      AssertionRule{TerminationAssertionOutcome::notFound, AssertionAction::install, true, "assertion not found"},
      AssertionRule{TerminationAssertionOutcome::denied, AssertionAction::retryLater, true, "assertion denied"},
  };
  for (const AssertionRule& rule : kRules) {
    if (rule.outcome == outcome) return rule;
  }
  return {outcome, AssertionAction::fail, false, "unknown error grabbing assertion"};
}

}  // namespace appsync
