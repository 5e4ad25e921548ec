// The man pages describe exactly the commands, options and keys of the tool.
#include <filesystem>
#include <regex>
#include <set>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "generated/BuildPaths.h"
#include "tests/support/HelpText.h"
#include "tests/support/ToolFixture.h"

namespace appsync::test {

namespace {

using testing::HasSubstr;

using Names = std::set<std::string>;

std::string pagePath(const std::string& command) {
  return std::string(kSourceFolder) + "/docs/man/appsync" + (command.empty() ? "" : "-" + command) + ".1";
}

std::string pageOf(const std::string& command) {
  std::ifstream file(pagePath(command));
  return {std::istreambuf_iterator<char>(file), {}};
}

/// Returns the lines of a section without its title.
std::string section(const std::string& page, const std::string& title) {
  const std::string heading = ".Sh " + title + "\n";
  const std::size_t start = page.find(heading);
  if (start == std::string::npos) return {};
  const std::size_t end = page.find("\n.Sh ", start + heading.size());
  return page.substr(start + heading.size(), end == std::string::npos ? end : end + 1 - start - heading.size());
}

/// Returns the first group of each match of `pattern` in `text`.
Names caughtIn(const std::string& text, const std::string& pattern) {
  const std::regex expression(pattern);
  return {std::sregex_token_iterator(text.begin(), text.end(), expression, 1), std::sregex_token_iterator()};
}

/// Returns the options in the items of a list, as "-o" and "--output".
Names optionsIn(const std::string& list) {
  Names options;
  for (const std::string& item : caughtIn(list, "\\.It (Fl .*)")) {
    for (const std::string& name : caughtIn(item, "Fl (-?[a-z]+)"))
      options.insert("-" + name);
  }
  return options;
}

/// Returns the quoted words.
Names quotedIn(const std::string& text) {
  return caughtIn(text, "\\.(?:It )?Ql ([A-Za-z]+)");
}

Names allCommands() {
  Names commands;
  for (const auto& [command, purpose] : helpOf().commands)
    commands.insert(command);
  return commands;
}

Names allPages() {
  Names pages = allCommands();
  pages.insert("");
  return pages;
}

Names keysOf(const cli::Json& object) {
  Names keys;
  for (const auto& [key, value] : object.items())
    keys.insert(key);
  return keys;
}

TEST(ManPages, EveryCommandHasExactlyOne) {
  Names expected;
  for (const std::string& command : allPages())
    expected.insert(std::filesystem::path(pagePath(command)).filename());
  Names found;
  for (const auto& entry : std::filesystem::directory_iterator(std::string(kSourceFolder) + "/docs/man"))
    found.insert(entry.path().filename());
  EXPECT_EQ(found, expected);
}

TEST(ManPages, RenderWithoutWarnings) {
  for (const std::string& command : allPages()) {
    const Finished run = runProgram("groff", {"-mandoc", "-Tutf8", "-P-cbou", "-ww", pagePath(command)});
    EXPECT_EQ(run.status, 0) << command;
    EXPECT_EQ(run.err, "") << command;
    EXPECT_THAT(run.out, HasSubstr("EXIT STATUS")) << command;
  }
}

TEST(ManPages, RendererReportsMistakes) {
  const Finished run =
      runProgram("groff", {"-mandoc", "-Tutf8", "-ww"}, {.input = ".Dd June 1, 2026\n.Dt A 1\n.Os\n.Nosuch\n"});
  EXPECT_THAT(run.err, HasSubstr("Nosuch"));
}

TEST(ManPages, HaveThePurposeOfTheHelp) {
  for (const auto& [command, purpose] : helpOf().commands) {
    std::string small = purpose;
    small[0] = static_cast<char>(std::tolower(static_cast<unsigned char>(small[0])));
    EXPECT_THAT(pageOf(command), HasSubstr("\n.Nd " + small + "\n"));
    EXPECT_THAT(pageOf(""),
                HasSubstr(std::string(".It Xr appsync-").append(command).append(" 1\n").append(small).append("\n")));
    EXPECT_EQ(helpOf(command).purpose, purpose);
  }
}

TEST(ManPages, NameExactlyTheOptions) {
  for (const std::string& command : allPages()) {
    Names expected;
    for (const auto& [option, description] : helpOf(command).options)
      expected.insert(option);
    EXPECT_EQ(optionsIn(section(pageOf(command), "OPTIONS")), expected) << command;
  }
}

TEST(ManPages, NameExactlyTheArguments) {
  for (const std::string& command : allCommands()) {
    const std::vector<std::string> positionals = helpOf(command).positionals;
    const std::string arguments = section(pageOf(command), "ARGUMENTS");
    EXPECT_EQ(caughtIn(arguments, "\\.It Ar (.*)"), Names(positionals.begin(), positionals.end())) << command;
  }
}

TEST(ManPages, HaveAnExample) {
  for (const std::string& command : allCommands()) {
    const std::string help = runTool({command, "--help"}).out;
    EXPECT_THAT(help, HasSubstr("\n  appsync " + command + " "));
    EXPECT_THAT(section(pageOf(command), "EXAMPLES"), HasSubstr("$ appsync " + command + " "));
  }
}

TEST(ManPages, NameExactlyTheSettings) {
  const std::string help = runTool({"set", "--help"}).out;
  const std::string keys = help.substr(0, help.find("Examples:"));
  EXPECT_EQ(caughtIn(pageOf("set"), "\\.It Cm ([a-z-]+) Ns ="), caughtIn(keys, "\n  ([a-z-]+) +[a-zA-Z]"));
}

class JsonInManPages : public ToolFixture {
 protected:
  void SetUp() override {
    ToolFixture::SetUp();
    publish("org.a");
    write(library() + "/broken.zip", "x");
  }
  static std::string jsonOf(const std::string& command) { return section(pageOf(command), "JSON"); }
};

TEST_F(JsonInManPages, AppsNamesExactlyTheKeys) {
  ASSERT_EQ(sync().status, 1);
  const cli::Json apps = cli::Json::parse(runTool({"apps", device(), "--json"}).out);
  EXPECT_EQ(caughtIn(jsonOf("apps"), "\\.It Ql (.*)"), keysOf(apps.at(0)));
}

TEST_F(JsonInManPages, HistoryNamesExactlyTheKeys) {
  ASSERT_EQ(sync().status, 1);
  const cli::Json events = cli::Json::parse(runTool({"history", device(), "--json"}).out);
  EXPECT_EQ(caughtIn(jsonOf("history"), "\\.It Ql (.*)"), keysOf(events.at(0)));
}

TEST_F(JsonInManPages, ReportNamesExactlyTheKeys) {
  publish("org.b", "1.0", {{"HarvoMetadata.plist", "{corvelId = x;}"}});
  ASSERT_EQ(sync().status, 1);
  const cli::Json report = cli::Json::parse(runTool({"report", device(), "--json"}).out);
  Names seen = {"yes", "no", "unset"};
  for (const cli::Json& object :
       {report, report.at("metrics"), report.at("accounts").at(0), report.at("restrictions")}) {
    const Names keys = keysOf(object);
    seen.insert(keys.begin(), keys.end());
  }
  EXPECT_EQ(caughtIn(jsonOf("report"), "\\.(?:It )?Ql ([A-Za-z-]+)"), seen);
}

TEST_F(JsonInManPages, SyncNamesEveryEventAndKey) {
  Names seen = {"event"};
  for (const std::vector<std::string>& words : {std::vector<std::string>{}, {"--remove", "org.a"}}) {
    for (const cli::Json& event : eventsIn(sync(words.empty() ? std::vector<std::string>{"--json"}
                                                              : std::vector<std::string>{"--json", words[0], words[1]})
                                               .out)) {
      const Names keys = keysOf(event);
      seen.insert(keys.begin(), keys.end());
      seen.insert(std::string(event.at("event")));
    }
  }
  seen.insert("waiting");  // needs a home screen that does not release an app
  EXPECT_EQ(quotedIn(jsonOf("sync")), seen);
}

TEST_F(JsonInManPages, RestoreNamesEveryEventAndKey) {
  ASSERT_EQ(sync().status, 1);
  ASSERT_EQ(runTool({"backup", device(), path("backup")}).status, 0);
  ASSERT_EQ(runTool({"init", path("new")}).status, 0);
  Names seen = {"event", "reason"};
  for (const cli::Json& event : eventsIn(runTool({"restore", path("new"), path("backup"), "--json"}).out)) {
    const Names keys = keysOf(event);
    seen.insert(keys.begin(), keys.end());
    seen.insert(std::string(event.at("event")));
  }
  EXPECT_EQ(quotedIn(jsonOf("restore")), seen);
}

}  // namespace

}  // namespace appsync::test
