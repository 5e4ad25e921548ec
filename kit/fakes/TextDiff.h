// Differences between two lists of lines, for people.
#pragma once

#include <string>
#include <vector>

#include <gtest/gtest.h>

namespace appsync::test {

/// Succeeds when both are equal; else shows the lines in order, "-" before those that are missing and "+" before those
/// that are too many: `EXPECT_TRUE(sameLines({"registry.addObserver"}, platform.journal.lines({"registry."})))`.
[[nodiscard]] testing::AssertionResult sameLines(const std::vector<std::string>& expected,
                                                 const std::vector<std::string>& actual);

}  // namespace appsync::test
