// Thousands of random documents, back and forth with Python's plistlib.
#include <cstdlib>
#include <fstream>
#include <iterator>

#include <gtest/gtest.h>

#include "generated/BuildPaths.h"
#include "kit/fakes/TemporaryFolder.h"
#include "plist/PropertyList.h"

namespace appsync::test {

namespace {

constexpr int kDocuments = 2000;

/// Runs the script that makes and checks documents; true when it is content.
bool runScript(const std::string& action, int seed, const std::filesystem::path& file) {
  const std::string command = "python3 '" + std::string(kSourceFolder) + "/tests/plist/plistlib_documents.py' " +
                              action + " " + std::to_string(seed) + " " + std::to_string(kDocuments) + " '" +
                              file.string() + "'";
  return std::system(command.c_str()) == 0;
}

std::string readFile(const std::filesystem::path& path) {
  std::ifstream file(path, std::ios::binary);
  return {std::istreambuf_iterator<char>(file), {}};
}

std::uint32_t lengthAt(std::string_view text) {
  std::uint32_t length = 0;
  for (const char c : text.substr(0, 4))
    length = length << 8 | static_cast<unsigned char>(c);
  return length;
}

void appendDocument(std::string& out, std::string_view document) {
  for (const int shift : {24, 16, 8, 0})
    out += static_cast<char>(document.size() >> shift);
  out += document;
}

/// Every document read and written again in the form it was in, after a detour through the other form when that can
/// hold it.
std::string rewritten(std::string_view documents) {
  std::string out;
  while (!documents.empty()) {
    const std::string_view document = documents.substr(4, lengthAt(documents));
    documents.remove_prefix(4 + document.size());
    const bool isBinary = document.starts_with("bplist");
    auto value = plist::read(bytesOf(document));
    EXPECT_TRUE(value.ok()) << value.error().text;
    if (!value.ok()) return out;
    if (!isBinary) {
      const auto detour = plist::writeBinary(*value);
      EXPECT_TRUE(detour.ok());
      auto back = plist::read(*detour);
      EXPECT_TRUE(back.ok());
      EXPECT_EQ(*back, *value);
      value = back;
    }
    const auto written = isBinary ? plist::writeBinary(*value) : plist::writeXML(*value);
    EXPECT_TRUE(written.ok());
    if (written.ok()) appendDocument(out, textOf(*written));
  }
  return out;
}

class PropertyListPlistlib : public testing::TestWithParam<int> {};

TEST_P(PropertyListPlistlib, AgreesWithPlistlib) {
  const TemporaryFolder folder;
  const auto theirs = std::filesystem::path(folder.path("theirs"));
  const auto ours = std::filesystem::path(folder.path("ours"));
  ASSERT_TRUE(runScript("write", GetParam(), theirs));
  std::ofstream(ours, std::ios::binary) << rewritten(readFile(theirs));
  EXPECT_TRUE(runScript("check", GetParam(), ours));
}

INSTANTIATE_TEST_SUITE_P(Seeds, PropertyListPlistlib, testing::Values(1, 2));

}  // namespace

}  // namespace appsync::test
