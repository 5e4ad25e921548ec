// Links in the documents lead to files, and source files that the documents name exist.
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

std::string contentOf(const fs::path& path) {
  std::ifstream file(path);
  return {std::istreambuf_iterator<char>(file), {}};
}

/// Returns the first group of each match.
Names matchesIn(const std::string& text, const std::regex& pattern) {
  return {std::sregex_token_iterator(text.begin(), text.end(), pattern, 1), std::sregex_token_iterator()};
}

/// Returns the targets in this repository of "[text](target)" and of pictures, without the part after "#". Code such as
/// "[](int value)" is no link.
Names linksIn(const std::string& text) {
  Names links = matchesIn(text, std::regex(R"([^\[]\]\((?!https?:)([^)#\s]+)[^)]*\))"));
  links.merge(matchesIn(text, std::regex(R"re(<img src="([^"]+)")re")));
  return links;
}

/// Returns the source files in backquotes, such as `base/Error.h`. Generated ones are left out.
Names sourcesIn(const std::string& text) {
  return matchesIn(text, std::regex("`((?!generated/)(?:[A-Za-z_-]+/)+[A-Za-z0-9_.-]+\\."
                                    "(?:h|cpp|cmake|py|sh|json|in|map|bash))`"));
}

TEST(Links, LeadToFiles) {
  std::size_t links = 0;
  for (const fs::path& document : documents()) {
    for (const std::string& target : linksIn(contentOf(document))) {
      ++links;
      EXPECT_TRUE(fs::exists(document.parent_path() / target)) << document << ": " << target;
    }
  }
  EXPECT_GT(links, 10U);
}

TEST(Links, NamedSourcesExist) {
  std::size_t sources = 0;
  for (const fs::path& document : documents()) {
    if (document.filename() == "CHANGELOG.md") continue;  // names files of earlier versions
    for (const std::string& source : sourcesIn(contentOf(document))) {
      ++sources;
      EXPECT_TRUE(fs::exists(fs::path(kSourceFolder) / source) || fs::exists(document.parent_path() / source))
          << document << ": " << source;
    }
  }
  EXPECT_GT(sources, 20U);
}

TEST(Links, AreFoundInText) {
  EXPECT_EQ(linksIn("see [a](b/c.md), [d](e.md#f) and [g](https://h.i) [](int j) <img src=\"j.png\">"),
            (Names{"b/c.md", "e.md", "j.png"}));
  EXPECT_EQ(sourcesIn("`base/Error.h`, `x`, `cmake/a_b.py`, `cmake/c-d.cmake.in`"),
            (Names{"base/Error.h", "cmake/a_b.py", "cmake/c-d.cmake.in"}));
}

}  // namespace
}  // namespace appsync::test
