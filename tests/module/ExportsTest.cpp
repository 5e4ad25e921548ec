// The symbols that the module exports.
#include <array>
#include <cstdio>
#include <string>

#include <gtest/gtest.h>

#include "generated/BuildPaths.h"
#include "platform/Module.h"

namespace appsync::test {

namespace {

std::string outputOf(const std::string& command) {
  std::string output;
  std::FILE* pipe = ::popen(command.c_str(), "r");
  if (pipe == nullptr) return "the command cannot be run";
  std::array<char, 4096> part = {};
  while (const std::size_t size = std::fread(part.data(), 1, part.size(), pipe))
    output.append(part.data(), size);
  ::pclose(pipe);
  return output;
}

TEST(Exports, EntryPointIsTheOnlySymbol) {
  const std::string lines = outputOf("nm --dynamic --defined-only --portability '" + std::string(kModule) + "'");
  EXPECT_EQ(lines.substr(0, lines.find(' ')), platform::kModuleEntryPointName);
  EXPECT_EQ(lines.find('\n') + 1, lines.size()) << lines;
}

}  // namespace

}  // namespace appsync::test
