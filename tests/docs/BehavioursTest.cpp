// docs/behaviours.md against the tests: every behaviour names a test, every test named is there, and every test of the
// plug-in and of the services' contracts is named.
#include <array>
#include <filesystem>
#include <fstream>
#include <functional>
#include <iterator>
#include <map>
#include <regex>
#include <set>
#include <sstream>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "generated/BuildPaths.h"

namespace appsync::test {
namespace {

using Strings = std::vector<std::string>;

/// The tests, as "Suite.Name", in a test file of the repository; none when there is no such file.
using TestsIn = std::function<std::set<std::string>(const std::string& file)>;

std::string fileContent(const std::filesystem::path& path) {
  std::ifstream file(path);
  return {std::istreambuf_iterator<char>(file), {}};
}

std::set<std::string> testsInSource(const std::string& source) {
  static const std::regex kTest(R"(TEST(?:_[FP])?\(\s*(\w+)\s*,\s*(\w+)\s*\))");
  std::set<std::string> names;
  for (std::sregex_iterator match(source.begin(), source.end(), kTest), end; match != end; ++match)
    names.insert((*match)[1].str() + "." + (*match)[2].str());
  return names;
}

std::set<std::string> testsInRepository(const std::string& file) {
  return testsInSource(fileContent(std::filesystem::path(kSourceFolder) / file));
}

/// What stands in backquotes in a cell.
Strings quotedIn(const std::string& cell) {
  static const std::regex kQuoted("`([^`]+)`");
  return {std::sregex_token_iterator(cell.begin(), cell.end(), kQuoted, 1), std::sregex_token_iterator()};
}

/// The cells of a row "| a | b |"; none when the line is no row.
Strings cellsOf(const std::string& line) {
  Strings cells;
  if (!line.starts_with("| ")) return cells;
  std::istringstream rest(line.substr(1));
  for (std::string cell; std::getline(rest, cell, '|');)
    cells.push_back(cell);
  return cells;
}

/// What is wrong with a row.
Strings findingsOnRow(const Strings& cells, const TestsIn& testsIn) {
  const std::string behaviour = cells[0];
  if (cells.size() != 3) return {behaviour + ": not three cells"};
  const Strings files = quotedIn(cells[1]);
  const Strings tests = quotedIn(cells[2]);
  if (files.size() != 1) return {behaviour + ": not one file"};
  if (tests.empty()) return {behaviour + ": no test"};
  const std::set<std::string> known = testsIn(files[0]);
  Strings findings;
  for (const std::string& test : tests) {
    if (!known.contains(test)) findings.push_back(behaviour + ": no test " + test + " in " + files[0]);
  }
  return findings;
}

Strings findingsIn(const std::string& document, const TestsIn& testsIn) {
  Strings findings;
  std::istringstream lines(document);
  for (std::string line; std::getline(lines, line);) {
    const Strings cells = cellsOf(line);
    if (cells.empty() || line.starts_with("| Behaviour |")) continue;
    const Strings onRow = findingsOnRow(cells, testsIn);
    findings.insert(findings.end(), onRow.begin(), onRow.end());
  }
  return findings;
}

Strings findingsInExample(const std::string& row) {
  return findingsIn("| Behaviour | File | Test |\n|---|---|---|\n" + row + "\n", [](const std::string& file) {
    return file == "tests/a/ATest.cpp" ? testsInSource("TEST_F(A,\n       Works) {}\nTEST(A, Fails) {}")
                                       : std::set<std::string>();
  });
}

TEST(Behaviours, EveryBehaviourNamesTestsThatExist) {
  const std::string document = fileContent(std::filesystem::path(kSourceFolder) / "docs/behaviours.md");
  EXPECT_NE(document.find("\n## Core\n"), std::string::npos);
  EXPECT_NE(document.find("\n## Asset transfer and installation\n"), std::string::npos);
  std::map<std::string, std::set<std::string>> read;
  const auto testsIn = [&](const std::string& file) -> const std::set<std::string>& {
    const auto found = read.find(file);
    return found != read.end() ? found->second : read.emplace(file, testsInRepository(file)).first->second;
  };
  EXPECT_EQ(findingsIn(document, testsIn), Strings());
}

/// Whose tests prove what is promised to others.
constexpr std::array kFolders = {"tests/core",        "tests/transfer",  "tests/coordination",
                                 "tests/restore",     "tests/reporting", "tests/faults",
                                 "tests/integration", "tests/module",    "kit/contracts"};

/// The tests in a source that the document does not name.
Strings unnamedTestsIn(const std::string& source, const std::string& document) {
  Strings unnamed;
  for (const std::string& test : testsInSource(source)) {
    if (document.find("`" + test + "`") == std::string::npos) unnamed.push_back(test);
  }
  return unnamed;
}

TEST(Behaviours, EveryTestOfThePlugInAndOfContractsIsNamed) {
  const std::filesystem::path root = kSourceFolder;
  const std::string document = fileContent(root / "docs/behaviours.md");
  for (const char* folder : kFolders) {
    std::size_t sources = 0;
    for (const auto& entry : std::filesystem::directory_iterator(root / folder)) {
      if (entry.path().extension() != ".cpp") continue;
      ++sources;
      EXPECT_EQ(unnamedTestsIn(fileContent(entry.path()), document), Strings()) << entry.path();
    }
    EXPECT_GT(sources, 0U) << folder;
  }
}

TEST(Behaviours, ATestThatIsNotNamedIsFound) {
  const std::string source = "TEST(A, Works) {}\nTEST_P(B,\n       WorksToo) {}\n";
  EXPECT_EQ(unnamedTestsIn(source, "| It works | `tests/a/ATest.cpp` | `A.Works`, `B.Works` |"), Strings{"B.WorksToo"});
  EXPECT_EQ(unnamedTestsIn(source, "`A.Works` `B.WorksToo`"), Strings());
}

TEST(Behaviours, ATestWithParametersIsFoundUnderItsSuite) {
  EXPECT_EQ(testsInSource("TEST_P(Each, Works) {}\nINSTANTIATE_TEST_SUITE_P(All, Each, testing::Values(1));"),
            std::set<std::string>{"Each.Works"});
}

TEST(Behaviours, ARowWithTestsThatExistIsInOrder) {
  EXPECT_EQ(findingsInExample("| It works | `tests/a/ATest.cpp` | `A.Works`, `A.Fails` |"), Strings());
}

TEST(Behaviours, ATestThatDoesNotExistIsFound) {
  EXPECT_EQ(findingsInExample("| It works | `tests/a/ATest.cpp` | `A.Work` |"),
            Strings{" It works : no test A.Work in tests/a/ATest.cpp"});
}

TEST(Behaviours, AFileThatDoesNotExistIsFound) {
  EXPECT_EQ(findingsInExample("| It works | `tests/a/BTest.cpp` | `A.Works` |"),
            Strings{" It works : no test A.Works in tests/a/BTest.cpp"});
}

TEST(Behaviours, ARowWithoutATestIsFound) {
  EXPECT_EQ(findingsInExample("| It works | `tests/a/ATest.cpp` |  |"), Strings{" It works : no test"});
  EXPECT_EQ(findingsInExample("| It works | `tests/a/ATest.cpp` |"), Strings{" It works : not three cells"});
  EXPECT_EQ(findingsInExample("| It works |  | `A.Works` |"), Strings{" It works : not one file"});
}

}  // namespace
}  // namespace appsync::test
