// Checks that every suite of the archive is linked and instantiated.
#include <filesystem>
#include <fstream>
#include <iterator>
#include <map>
#include <regex>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "generated/BuildPaths.h"

namespace appsync::test {

namespace {

std::vector<std::string> suitesInHeaders() {
  static const std::regex kSuite("class (\\w+Contract) : public Contract<");
  std::vector<std::string> suites;
  for (const auto& entry : std::filesystem::directory_iterator(std::string(kSourceFolder) + "/kit/contracts")) {
    if (entry.path().extension() != ".h") continue;
    std::ifstream header(entry.path());
    for (std::string line; std::getline(header, line);) {
      if (std::smatch match; std::regex_search(line, match, kSuite)) suites.push_back(match[1]);
    }
  }
  return suites;
}

std::map<std::string, int> testsInThisProgram() {
  std::map<std::string, int> tests;
  const testing::UnitTest& program = *testing::UnitTest::GetInstance();
  for (int index = 0; index < program.total_test_suite_count(); ++index) {
    const testing::TestSuite& suite = *program.GetTestSuite(index);
    tests[suite.name()] = suite.total_test_count();
  }
  return tests;
}

}  // namespace

TEST(Suites, EachRunsOnTheFakesAndTheEmbeddedDevice) {
  const std::vector<std::string> suites = suitesInHeaders();
  EXPECT_GE(suites.size(), 17U);
  std::map<std::string, int> tests = testsInThisProgram();
  for (const std::string& suite : suites) {
    EXPECT_GT(tests["Fakes/" + suite], 0) << suite;
    EXPECT_GT(tests["Device/" + suite], 0) << suite;
  }
}

TEST(Suites, EachIsListedInThePortingGuide) {
  std::ifstream file(std::string(kSourceFolder) + "/docs/porting.md");
  const std::string guide{std::istreambuf_iterator<char>(file), {}};
  for (const std::string& suite : suitesInHeaders())
    EXPECT_NE(guide.find('`' + suite + '`'), std::string::npos) << suite;
}

}  // namespace appsync::test
