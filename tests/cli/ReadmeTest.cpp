// The commands of README.md.
#include <filesystem>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "generated/BuildPaths.h"
#include "tests/support/HelpText.h"
#include "tests/support/ToolFixture.h"

namespace appsync::test {

namespace {

using testing::HasSubstr;
using testing::UnorderedElementsAre;

std::string readme() {
  std::ifstream file(std::string(kSourceFolder) + "/README.md");
  return {std::istreambuf_iterator<char>(file), {}};
}

/// Returns the commands of a section: its lines that are indented by four spaces.
std::string commandsIn(const std::string& title) {
  std::istringstream text(readme());
  std::string commands;
  bool isInside = false;
  for (std::string line; std::getline(text, line);) {
    if (line.starts_with("## ")) isInside = line == "## " + title;
    if (isInside && line.starts_with("    ")) commands += line.substr(4) + "\n";
  }
  return commands;
}

std::vector<std::string> namesIn(const std::string& folder) {
  std::vector<std::string> names;
  for (const auto& entry : std::filesystem::directory_iterator(folder))
    names.push_back(entry.path().filename());
  return names;
}

TEST(Readme, CommandsWork) {
  const TemporaryFolder clone;
  const TemporaryFolder home;
  std::filesystem::create_directory_symlink(std::string(kSourceFolder) + "/samples", clone.path("samples"));
  std::filesystem::create_directories(clone.path("build"));
  std::filesystem::create_directory_symlink(kBinaryFolder, clone.path("build/bin"));
  const std::string commands = "cd " + clone.path() + "\n" + commandsIn("Your own device");
  EXPECT_THAT(commands, HasSubstr("\nappsync restore new-device my-backup\n"));
  const Finished run = runProgram(
      "bash", {"-eu"}, {.environment = {{"HOME", home.path()}}, .output = OutputTo::file, .input = commands});
  EXPECT_EQ(run.status, 0) << run.err;
  EXPECT_EQ(run.err, "");
  EXPECT_THAT(run.out, HasSubstr("installed  Hello 1.0\n"));
  EXPECT_THAT(run.out, HasSubstr("removed    Hello 1.0\n"));
  EXPECT_TRUE(std::filesystem::exists(home.path("appsync-try/screen.png")));
  const std::string apps = runTool({"apps", home.path("appsync-try/new-device")}).out;
  EXPECT_THAT(apps, HasSubstr("org.example.tides  "));
  EXPECT_THAT(apps, testing::EndsWith("installed\n"));
  EXPECT_THAT(namesIn(clone.path()), UnorderedElementsAre("build", "samples")) << "nothing is left in the clone";
}

TEST(Readme, NamesEveryCommand) {
  for (const auto& [command, purpose] : helpOf().commands)
    EXPECT_THAT(readme(), HasSubstr("\n| `" + command + " "));
}

}  // namespace

}  // namespace appsync::test
