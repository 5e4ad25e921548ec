// The parsed output of `--help`.
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

/// Returns the help of `command`, or of the tool if it is empty.
[[nodiscard]] HelpText helpOf(const std::string& command = {});

}  // namespace appsync::test
