// What the documents point at: every link leads to a file, and every source that they name is there.
#include <filesystem>
#include <fstream>
#include <iterator>
#include <regex>
#include <set>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "generated/BuildPaths.h"

namespace appsync::test {
namespace {

namespace fs = std::filesystem;
using Names = std::set<std::string>;

std::vector<fs::path> documents() {
  const fs::path root = kSourceFolder;
  std::vector<fs::path> found;
  for (const char* folder : {".", "docs", "examples/port"}) {
    for (const auto& entry : fs::directory_iterator(root / folder)) {
      if (entry.path().extension() == ".md") found.push_back(entry.path());
    }
  }
  return found;
}

Names caughtIn(const std::string& text, const std::regex& pattern) {
  return {std::sregex_token_iterator(text.begin(), text.end(), pattern, 1), std::sregex_token_iterator()};
}

/// Of "[text](target)" and of pictures the targets in this repository, without the part behind "#".
Names linksIn(const std::string& text) {
  Names links = caughtIn(text, std::regex(R"(\]\((?!https?:)([^)#\s]+)[^)]*\))"));
  links.merge(caughtIn(text, std::regex(R"re(<img src="([^"]+)")re")));
  return links;
}

/// The sources in backquotes, such as `base/Error.h`, but for those that are made when building.
Names sourcesIn(const std::string& text) {
  return caughtIn(text, std::regex("`((?!generated/)(?:[A-Za-z_-]+/)+[A-Za-z_]+\\.(?:h|cpp|cmake|py|sh))`"));
}

TEST(Links, EveryLinkOfADocumentLeadsToAFile) {
  std::size_t links = 0;
  for (const fs::path& document : documents()) {
    std::ifstream file(document);
    for (const std::string& target : linksIn({std::istreambuf_iterator<char>(file), {}})) {
      ++links;
      EXPECT_TRUE(fs::exists(document.parent_path() / target)) << document << ": " << target;
    }
  }
  EXPECT_GT(links, 10U);
}

TEST(Links, EverySourceThatADocumentNamesIsThere) {
  std::size_t sources = 0;
  for (const fs::path& document : documents()) {
    std::ifstream file(document);
    for (const std::string& source : sourcesIn({std::istreambuf_iterator<char>(file), {}})) {
      ++sources;
      EXPECT_TRUE(fs::exists(fs::path(kSourceFolder) / source) || fs::exists(document.parent_path() / source))
          << document << ": " << source;
    }
  }
  EXPECT_GT(sources, 20U);
}

TEST(Links, AreFoundAsTheyAreWritten) {
  EXPECT_EQ(linksIn("see [a](b/c.md), [d](e.md#f) and [g](https://h.i) <img src=\"j.png\">"),
            (Names{"b/c.md", "e.md", "j.png"}));
  EXPECT_EQ(sourcesIn("`base/Error.h`, `x`, `cmake/a_b.py`"), (Names{"base/Error.h", "cmake/a_b.py"}));
}

}  // namespace
}  // namespace appsync::test
