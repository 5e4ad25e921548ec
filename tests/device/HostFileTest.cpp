#include <cerrno>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>

#include <gtest/gtest.h>

#include "device/HostFile.h"
#include "kit/fakes/TemporaryFolder.h"

namespace appsync::test {
namespace {

std::string contents(const std::string& path) {
  std::ifstream file(path);
  return {std::istreambuf_iterator<char>(file), {}};
}

std::ptrdiff_t filesIn(const std::string& folder) {
  return std::distance(std::filesystem::directory_iterator(folder), std::filesystem::directory_iterator());
}

TEST(ReplaceHostFile, MakesAndReplacesAFileAndLeavesNothingElse) {
  const TemporaryFolder folder;
  EXPECT_TRUE(device::replaceHostFile(folder.path("file"), bytesOf("first")));
  EXPECT_EQ(contents(folder.path("file")), "first");
  EXPECT_TRUE(device::replaceHostFile(folder.path("file"), bytesOf("2")));
  EXPECT_EQ(contents(folder.path("file")), "2");
  EXPECT_EQ(filesIn(folder.path()), 1);
}

TEST(ReplaceHostFile, AFailureNamesThePathAndLeavesNothing) {
  const TemporaryFolder folder;
  const Status missing = device::replaceHostFile(folder.path("missing/file"), bytesOf("x"));
  ASSERT_FALSE(missing);
  EXPECT_EQ(missing.error(), Error::fromErrno(ENOENT, folder.path("missing/file") + " cannot be written"));
  std::filesystem::create_directory(folder.path("folder"));
  const Status onFolder = device::replaceHostFile(folder.path("folder"), bytesOf("x"));
  ASSERT_FALSE(onFolder);
  EXPECT_EQ(onFolder.error().code, EISDIR);
  EXPECT_EQ(filesIn(folder.path()), 1);
}

}  // namespace
}  // namespace appsync::test
