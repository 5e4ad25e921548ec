// Invalid command lines, and the help.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "tests/support/ToolRun.h"

namespace appsync::test {

namespace {

using testing::HasSubstr;

TEST(Usage, RefusesMissingCommand) {
  const Finished run = runTool({});
  EXPECT_EQ(run.status, 2);
  EXPECT_EQ(run.out, "");
  EXPECT_EQ(run.err, "appsync: a command is missing; `appsync --help` lists the commands\n");
}

TEST(Usage, NamesUnknownCommand) {
  const Finished run = runTool({"fly", "--high"});
  EXPECT_EQ(run.status, 2);
  EXPECT_EQ(run.err, "appsync: there is no command \"fly\"; `appsync --help` lists the commands\n");
}

TEST(Usage, UnknownSettingListsAllKeys) {
  const TemporaryFolder folder;
  ASSERT_EQ(runTool({"init", folder.path("device")}).status, 0);
  const Finished run = runTool({"set", folder.path("device"), "colour=red"});
  EXPECT_EQ(run.status, 2);
  EXPECT_EQ(
      run.err,
      "appsync: unknown setting \"colour\"; the settings are app-installation, app-removal, assertion, coordination, "
      "store, demote, demote-auto, licence\n");
}

TEST(Usage, NamesMissingArgumentAndHelp) {
  const Finished run = runTool({"sync", "device"});
  EXPECT_EQ(run.status, 2);
  EXPECT_THAT(run.err, HasSubstr("LIBRARY"));
  EXPECT_THAT(run.err, HasSubstr("`appsync sync --help`"));
}

TEST(Usage, RefusesUnknownOption) {
  EXPECT_EQ(runTool({"apps", "device", "--fast"}).status, 2);
}

TEST(Usage, RefusesUnknownFormat) {
  EXPECT_EQ(runTool({"plist", "file", "--to", "yaml"}).status, 2);
}

TEST(Usage, RefusesEmptyIdentifier) {
  for (const std::string option : {"--only", "--remove"}) {
    const Finished run = runTool({"sync", "device", "library", option, ""});
    EXPECT_EQ(run.status, 2);
    EXPECT_EQ(run.err, "appsync: the app identifier after " + option + " is empty; name an app\n");
  }
}

TEST(Usage, PrintsVersion) {
  const Finished run = runTool({"--version"});
  EXPECT_EQ(run.status, 0);
  EXPECT_THAT(run.out, testing::MatchesRegex("appsync [0-9]+\\.[0-9]+\\.[0-9]+\n"));
  EXPECT_EQ(runTool({"--version"}, {.output = OutputTo::full}).status, 3);
}

TEST(Usage, PathIsNeverAnAddress) {
  const TemporaryFolder folder;
  const Finished run =
      runProgram("sh", {"-c", "cd \"$0\" && appsync init file:x && appsync apps file:x", folder.path()});
  EXPECT_EQ(run.status, 0);
  EXPECT_EQ(run.err, "");
}

TEST(Usage, RefusesIdentifierInInvalidUTF8) {
  const Finished run = runTool({"sync", "device", "library", "--remove", "\xff\x1b[2J"});
  EXPECT_EQ(run.status, 2);
  EXPECT_THAT(run.err, HasSubstr("\\xff\\x1b[2J"));
}

TEST(Usage, RefusesRemoveAndOnlyOfOneApp) {
  const Finished run = runTool({"sync", "device", "library", "--remove", "org.a", "--only", "org.a"});
  EXPECT_EQ(run.status, 2);
  EXPECT_THAT(run.err, HasSubstr("both --remove and --only"));
}

TEST(Usage, RefusesCoordinatedAndDirect) {
  const Finished run = runTool({"init", "device", "--coordinated", "--direct"});
  EXPECT_EQ(run.status, 2);
  EXPECT_THAT(run.err, HasSubstr("--direct"));
}

class Help : public testing::TestWithParam<const char*> {};

TEST_P(Help, HasAnExample) {
  const Finished run = runTool({GetParam(), "--help"});
  EXPECT_EQ(run.status, 0);
  EXPECT_EQ(run.err, "");
  EXPECT_THAT(run.out, HasSubstr("Example"));
  EXPECT_THAT(run.out, HasSubstr(std::string("appsync ") + GetParam()));
}

TEST_P(Help, HasAUsageLine) {
  EXPECT_THAT(runTool({GetParam(), "--help"}).out,
              HasSubstr(std::string("\nUsage: appsync ") + GetParam() + " [OPTIONS] "));
}

INSTANTIATE_TEST_SUITE_P(Commands, Help,
                         testing::Values("init", "pack", "sync", "backup", "restore", "tap", "cancel", "apps", "report",
                                         "screen", "history", "set", "clear", "plist"),
                         [](const auto& command) { return std::string(command.param); });

TEST(Usage, HelpNamesEveryExitStatus) {
  const Finished run = runTool({"--help"});
  EXPECT_EQ(run.status, 0);
  EXPECT_THAT(run.out, HasSubstr("0 done, 1 some app failed, 2 wrong usage, 3 "));
}

TEST(Usage, HelpToClosedPipeIsNoError) {
  EXPECT_EQ(runTool({"--help"}, {.output = OutputTo::closedPipe}).status, 0);
}

TEST(Usage, HelpToFullDiskIsAnError) {
  const Finished run = runTool({"--help"}, {.output = OutputTo::full});
  EXPECT_EQ(run.status, 3);
  EXPECT_EQ(run.err, "appsync: standard output cannot be written: No space left on device\n");
}

}  // namespace

}  // namespace appsync::test
