// What `--help` says, taken apart.
#pragma once

#include <map>
#include <string>
#include <vector>

namespace appsync::test {

/// The help of the tool, or of one of its commands.
struct HelpText {
  std::string purpose;  ///< its first line, without the full stop
  std::vector<std::string> positionals;
  std::map<std::string, std::string> options;  ///< of each name, dashes included, what it does
  std::map<std::string, std::string> commands;
};

/// The help of `command`, or of the whole tool.
[[nodiscard]] HelpText helpOf(const std::string& command = {});

}  // namespace appsync::test
