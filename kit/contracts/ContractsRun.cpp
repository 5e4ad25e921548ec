// Makes a test program fail that links the contract suites but instantiates none.
#include <string_view>

#include <gtest/gtest.h>

namespace appsync::test {

namespace {

/// Instantiated suites are named "MyDevice/FileSystemContract".
bool isContract(const testing::TestSuite& suite) {
  const std::string_view name = suite.name();
  return name.find('/') != std::string_view::npos && name.ends_with("Contract") && suite.total_test_count() > 0;
}

}  // namespace

TEST(Contracts, AtLeastOneIsInstantiated) {
  const testing::UnitTest& program = *testing::UnitTest::GetInstance();
  for (int index = 0; index < program.total_test_suite_count(); ++index) {
    if (isContract(*program.GetTestSuite(index))) return;
  }
  FAIL() << "no contract suite is instantiated in this program; see kit/contracts/Contract.h";
}

}  // namespace appsync::test
