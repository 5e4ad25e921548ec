#include "tests/support/HelpText.h"

#include <sstream>

#include "tests/support/ToolRun.h"

namespace appsync::test {
namespace {

constexpr std::size_t kDescriptionColumn = 34;

std::string trimmed(const std::string& text) {
  const std::size_t first = text.find_first_not_of(' ');
  return first == std::string::npos ? std::string() : text.substr(first, text.find_last_not_of(' ') - first + 1);
}

std::string withoutFullStop(std::string text) {
  if (text.ends_with('.')) text.pop_back();
  return text;
}

/// Parses "  --name,-n TEXT       description", on one or two lines.
void addEntry(HelpText& help, const std::string& section, const std::string& line, std::istream& rest) {
  std::string description;
  if (line.size() > kDescriptionColumn && line[kDescriptionColumn - 1] == ' ') {
    description = line.substr(kDescriptionColumn);
  } else {
    std::getline(rest, description);
  }
  description = withoutFullStop(trimmed(description));
  std::istringstream names(line.substr(2, line.find(' ', 2) - 2));
  for (std::string name; std::getline(names, name, ',');) {
    if (section == "Positionals:") help.positionals.push_back(name);
    if (section == "Options:") help.options[name] = description;
    if (section == "Subcommands:") help.commands[name] = description;
  }
}

}  // namespace

HelpText helpOf(const std::string& command) {
  std::vector<std::string> words = {"--help"};
  if (!command.empty()) words.insert(words.begin(), command);
  std::istringstream text(runTool(words).out);
  HelpText help;
  std::string section;
  std::getline(text, help.purpose);
  help.purpose = withoutFullStop(help.purpose);
  for (std::string line; std::getline(text, line);) {
    if (!line.starts_with("  ")) {
      section = line;
    } else if (section == "Positionals:" || section == "Options:" || section == "Subcommands:") {
      addEntry(help, section, line, text);
    }
  }
  return help;
}

}  // namespace appsync::test
