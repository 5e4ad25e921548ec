#include "kit/fakes/TextDiff.h"

#include <algorithm>
#include <cstddef>

namespace appsync::test {

namespace {

using Lines = std::vector<std::string>;

/// lengths[i][j] is the length of the longest common part of `expected` from i on and `actual` from j on.
std::vector<std::vector<std::size_t>> commonLengths(const Lines& expected, const Lines& actual) {
  std::vector lengths(expected.size() + 1, std::vector<std::size_t>(actual.size() + 1));
  for (std::size_t i = expected.size(); i-- > 0;) {
    for (std::size_t j = actual.size(); j-- > 0;) {
      lengths[i][j] =
          expected[i] == actual[j] ? lengths[i + 1][j + 1] + 1 : std::max(lengths[i + 1][j], lengths[i][j + 1]);
    }
  }
  return lengths;
}

}  // namespace

testing::AssertionResult sameLines(const Lines& expected, const Lines& actual) {
  if (expected == actual) return testing::AssertionSuccess();
  const auto lengths = commonLengths(expected, actual);
  testing::AssertionResult failure = testing::AssertionFailure() << "- expected, + actual\n";
  std::size_t i = 0;
  std::size_t j = 0;
  while (i < expected.size() || j < actual.size()) {
    if (i < expected.size() && j < actual.size() && expected[i] == actual[j]) {
      failure << "  " << expected[i++] << "\n";
      ++j;
    } else if (j == actual.size() || (i < expected.size() && lengths[i + 1][j] >= lengths[i][j + 1])) {
      failure << "- " << expected[i++] << "\n";
    } else {
      failure << "+ " << actual[j++] << "\n";
    }
  }
  return failure;
}

}  // namespace appsync::test
