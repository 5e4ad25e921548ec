// The completions in bash, zsh and fish, by the shells themselves.
#include <map>
#include <ostream>
#include <set>
#include <sstream>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "generated/BuildPaths.h"
#include "tests/support/HelpText.h"
#include "tests/support/ToolFixture.h"

namespace appsync::test {

namespace {

using testing::HasSubstr;

using Offers = std::set<std::string>;
using OffersByLine = std::map<std::string, Offers>;

struct Shell {
  const char* name;
  std::vector<std::string> withoutConfiguration;
  const char* script;
};

std::ostream& operator<<(std::ostream& out, const Shell& shell) {
  return out << shell.name;
}

std::string nameOf(const testing::TestParamInfo<Shell>& shell) {
  return shell.param.name;
}

std::string scriptsFolder() {
  return std::string(kSourceFolder) + "/cli/completions";
}

/// Names of options and commands.
Offers namesIn(const std::map<std::string, std::string>& described) {
  Offers names;
  for (const auto& [name, description] : described)
    names.insert(name);
  return names;
}

/// In a folder with a device of two apps, a library and a file.
class Completions : public ToolFixture, public testing::WithParamInterface<Shell> {
 protected:
  void SetUp() override {
    ToolFixture::SetUp();
    publish("org.a");
    publish("org.b");
    ASSERT_EQ(sync().status, 0);
    write(path("file.txt"), "");
  }

  /// Returns the shell's completions of each line, as complete words.
  [[nodiscard]] OffersByLine offersFor(const std::vector<std::string>& lines) const {
    const Shell& shell = GetParam();
    std::vector<std::string> words = shell.withoutConfiguration;
    words.push_back(std::string(kSourceFolder) + "/tests/cli/completions/drive." + shell.name);
    words.insert(words.end(), {scriptsFolder(), path("")});
    std::string input;
    for (const std::string& line : lines)
      input += line + "\n";
    const std::map<std::string, std::string> environment = {{"LC_ALL", "C.UTF-8"},
                                                            {"HOME", home_.path()},
                                                            {"XDG_CONFIG_HOME", home_.path()},
                                                            {"XDG_DATA_HOME", home_.path()}};
    const Finished run =
        runProgram(shell.name, words, {.environment = environment, .output = OutputTo::file, .input = input});
    EXPECT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(run.err, "");
    return offersIn(run.out);
  }

  void expectOffers(const OffersByLine& expected) const {
    std::vector<std::string> lines;
    for (const auto& [line, offers] : expected)
      lines.push_back(line);
    EXPECT_EQ(offersFor(lines), expected);
  }

 private:
  /// Parses lines, each followed by its completions: indented, with a description after a tab.
  static OffersByLine offersIn(const std::string& output) {
    OffersByLine all;
    std::istringstream rest(output);
    Offers* offers = nullptr;
    for (std::string line; std::getline(rest, line);) {
      if (!line.starts_with("  ")) {
        offers = &all[line];
      } else if (offers != nullptr) {
        offers->insert(line.substr(2, line.find('\t') - 2));
      }
    }
    return all;
  }

  TemporaryFolder home_;
};

TEST_P(Completions, OffersExactlyTheCommands) {
  expectOffers({{"appsync ", namesIn(helpOf().commands)}, {"appsync s", {"sync", "screen", "set"}}, {"appsync x", {}}});
}

TEST_P(Completions, OffersExactlyTheOptions) {
  OffersByLine expected = {{"appsync -", namesIn(helpOf().options)}};
  for (const std::string& command : namesIn(helpOf().commands))
    expected["appsync " + command + " -"] = namesIn(helpOf(command).options);
  expectOffers(expected);
}

TEST_P(Completions, OffersFoldersAsDevices) {
  OffersByLine expected;
  for (const std::string& command : namesIn(helpOf().commands)) {
    const std::vector<std::string> positionals = helpOf(command).positionals;
    if (!positionals.empty() && positionals[0] == "DEVICE")
      expected["appsync " + command + " "] = {"device", "library"};
  }
  EXPECT_GE(expected.size(), 11U);
  expectOffers(expected);
}

TEST_P(Completions, OffersFoldersAsOtherArguments) {
  expectOffers({{"appsync sync device ", {"device", "library"}},
                {"appsync sync device l", {"library"}},
                {"appsync sync --json device l", {"library"}},
                {"appsync sync --log file.txt device l", {"library"}},
                {"appsync backup device l", {"library"}},
                {"appsync restore device l", {"library"}},
                {"appsync pack l", {"library"}},
                {"appsync pack f", {}}});
}

TEST_P(Completions, OffersNoExcessArgument) {
  expectOffers({{"appsync apps device l", {}}, {"appsync sync device library l", {}}, {"appsync clear device l", {}}});
}

TEST_P(Completions, OffersFilesAsFileArguments) {
  expectOffers({{"appsync plist f", {"file.txt"}},
                {"appsync plist -o f", {"file.txt"}},
                {"appsync plist --output f", {"file.txt"}},
                {"appsync pack library -o f", {"file.txt"}},
                {"appsync screen device -o f", {"file.txt"}},
                {"appsync sync device library --log f", {"file.txt"}},
                {"appsync restore device library --log f", {"file.txt"}},
                {"appsync sync device library --log=f", {"--log=file.txt"}}});
}

TEST_P(Completions, OffersPropertyListFormats) {
  expectOffers({{"appsync plist --to ", {"xml", "binary", "json"}}, {"appsync plist --to=b", {"--to=binary"}}});
}

TEST_P(Completions, OffersAppsOfTheDevice) {
  expectOffers({{"appsync tap device ", {"org.a", "org.b"}},
                {"appsync cancel device ", {"org.a", "org.b"}},
                {"appsync sync device library --remove ", {"org.a", "org.b"}},
                {"appsync sync device library --only ", {"org.a", "org.b"}},
                {"appsync sync device library --only org.a ", {"org.a", "org.b"}},
                {"appsync sync device library --only=org.b", {"--only=org.b"}}});
}

TEST_P(Completions, OffersNoAppsWithoutDevice) {
  expectOffers({{"appsync tap library ", {}}, {"appsync tap nowhere ", {}}, {"appsync set library demote=", {}}});
}

TEST_P(Completions, OffersKeysOfSettings) {
  const Offers keys = {"app-installation=", "app-removal=", "coordination=", "assertion=", "store=",
                       "demote=",           "demote-auto=", "licence="};
  expectOffers({{"appsync set device ", keys},
                {"appsync set device app-removal=no ", keys},
                {"appsync set device coo", {"coordination="}}});
}

TEST_P(Completions, OffersValuesOfSettings) {
  expectOffers({{"appsync set device app-installation=",
                 {"app-installation=yes", "app-installation=no", "app-installation=unset"}},
                {"appsync set device app-removal=", {"app-removal=yes", "app-removal=no", "app-removal=unset"}},
                {"appsync set device coordination=", {"coordination=on", "coordination=off", "coordination=unset"}},
                {"appsync set device coordination=of", {"coordination=off"}},
                {"appsync set device store=", {"store=device", "store=library", "store=unset"}},
                {"appsync set device demote=", {"demote=org.a", "demote=org.b"}},
                {"appsync set device demote-auto=", {"demote-auto=org.a", "demote-auto=org.b"}},
                {"appsync set device assertion=", {"assertion=org.a:", "assertion=org.b:"}},
                {"appsync set device assertion=org.a:",
                 {"assertion=org.a:granted", "assertion=org.a:denied", "assertion=org.a:unknown",
                  "assertion=org.a:failing", "assertion=org.a:unset"}},
                {"appsync set device licence=", {"licence=org.a:", "licence=org.b:"}},
                {"appsync set device licence=org.a:f", {"licence=org.a:file.txt"}}});
}

TEST_P(Completions, DescriptionsAreThoseOfTheHelp) {
  if (std::string(GetParam().name) == "bash") return;  // shows no descriptions
  std::ifstream file(scriptsFolder() + "/" + GetParam().script);
  std::string script{std::istreambuf_iterator<char>(file), {}};
  for (const auto& [command, purpose] : helpOf().commands) {
    EXPECT_THAT(script, HasSubstr(std::string(command).append(":").append(purpose)));
    for (const auto& [option, description] : helpOf(command).options)
      EXPECT_THAT(script, HasSubstr(description)) << command << " " << option;
  }
}

INSTANTIATE_TEST_SUITE_P(Shells, Completions,
                         testing::Values(Shell{"bash", {"--norc"}, "appsync.bash"}, Shell{"zsh", {"-f"}, "_appsync"},
                                         Shell{"fish", {"--no-config"}, "appsync.fish"}),
                         nameOf);

}  // namespace

}  // namespace appsync::test
