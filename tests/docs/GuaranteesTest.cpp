// docs/guarantees.md against the tests: each row names a test file and a suite that this file defines.
#include <filesystem>
#include <fstream>
#include <iterator>
#include <regex>
#include <sstream>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "generated/BuildPaths.h"

namespace appsync::test {
namespace {

/// Returns the content of a file of the repository, or an empty string if it cannot be read.
std::string contentOf(const std::string& path) {
  std::ifstream file(std::filesystem::path(kSourceFolder) / path);
  return {std::istreambuf_iterator<char>(file), {}};
}

bool definesSuite(const std::string& source, const std::string& suite) {
  return std::regex_search(source, std::regex(R"(\bTEST(_[FP])?\(\s*)" + suite + R"(\s*,)"));
}

/// Returns the rows of the tables, without their headings.
std::vector<std::string> rowsOf(const std::string& document) {
  std::vector<std::string> rows;
  std::istringstream lines(document);
  for (std::string line; std::getline(lines, line);) {
    if (line.starts_with("| ") && !line.starts_with("| guarantee |")) rows.push_back(line);
  }
  return rows;
}

TEST(Guarantees, NameSuitesThatExist) {
  const std::vector<std::string> rows = rowsOf(contentOf("docs/guarantees.md"));
  EXPECT_GT(rows.size(), 30U);
  const std::regex kRow(R"(\| [A-Z][^|]*\. \| `(\w+)` \| `([^`]+\.cpp)` \|)");
  for (const std::string& row : rows) {
    std::smatch cells;
    if (!std::regex_match(row, cells, kRow)) {
      ADD_FAILURE() << "not a sentence, a suite and a file: " << row;
    } else {
      EXPECT_TRUE(definesSuite(contentOf(cells[2]), cells[1])) << "no suite " << cells[1] << " in " << cells[2];
    }
  }
}

TEST(Guarantees, FindSuitesOfEveryKindOfTest) {
  EXPECT_TRUE(definesSuite("TEST(Suite, Works) {}", "Suite"));
  EXPECT_TRUE(definesSuite("TEST_F(Suite,\n       Works) {}", "Suite"));
  EXPECT_TRUE(definesSuite("TEST_P(Suite, Works) {}", "Suite"));
  EXPECT_FALSE(definesSuite("TEST(Suite, Works) {}", "Suit"));
  EXPECT_FALSE(definesSuite("TEST(Other, Suite) {}", "Suite"));
}

}  // namespace
}  // namespace appsync::test
