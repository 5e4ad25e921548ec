// Keeps a porter's test program from passing because it runs nothing.
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
  FAIL() << "this program links the contract suites and holds nothing to them: see kit/contracts/Contract.h";
}

}  // namespace appsync::test
