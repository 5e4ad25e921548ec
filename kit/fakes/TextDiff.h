// Readable differences between two lists of lines.
#pragma once

#include <string>
#include <vector>

#include <gtest/gtest.h>

namespace appsync::test {

/// Succeeds if both are equal; else shows all lines in order, "-" before missing and "+" before unexpected ones:
/// `EXPECT_TRUE(sameLines({"registry.addObserver"}, platform.journal.lines({"registry."})))`.
[[nodiscard]] testing::AssertionResult sameLines(const std::vector<std::string>& expected,
                                                 const std::vector<std::string>& actual);

}  // namespace appsync::test
