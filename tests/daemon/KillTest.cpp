// Killed and interrupted syncs, and their recovery by the next sync.
#include <csignal>
#include <fstream>
#include <iterator>
#include <memory>

#include <gmock/gmock.h>

#include "tests/support/KilledTool.h"
#include "tests/support/ToolFixture.h"

namespace appsync::test {

namespace {

using testing::AnyOf;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::StartsWith;

class Kill : public ToolFixtureOfEachMode {
 protected:
  /// One app to install, one to update and one to remove.
  void prepare() {
    publish("org.update");
    publish("org.remove");
    ASSERT_EQ(sync().status, 0);
    publish("org.update", "2.0");
    publish("org.install", "1.0", {{"HarvoMetadata.plist", infoPlist("org.install")}});
  }
  /// Returns the state that must not depend on the kill.
  [[nodiscard]] std::vector<std::string> state() const {
    std::vector<std::string> state = apps();
    std::ranges::sort(state);
    std::ifstream file(device() + "/host-state.plist");
    state.emplace_back(std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>());
    for (const char* folder : {"/root/var/mobile/Media/PublicStaging", "/work"}) {
      const std::filesystem::directory_iterator entries(device() + folder);
      state.push_back(folder + std::string(" ") + std::to_string(std::distance(begin(entries), end(entries))));
    }
    const std::filesystem::directory_iterator containers(device() + "/root/var/mobile/Containers/Bundle");
    state.push_back("containers " + std::to_string(std::distance(begin(containers), end(containers))));
    return state;
  }
};

INSTANTIATE_TEST_SUITE_P(Modes, Kill, kModes, nameOfMode);

TEST_P(Kill, NextSyncRecoversFromAnyStep) {
  prepare();
  std::filesystem::copy(device(), path("original"), std::filesystem::copy_options::recursive);
  const auto syncWithRemoval = [this](const ToolOptions& options) { return sync({"--remove", "org.remove"}, options); };
  ASSERT_EQ(syncWithRemoval({}).status, 0);
  const std::vector<std::string> undisturbed = state();
  EXPECT_THAT(undisturbed, Contains("org.update 2.0"));

  const auto reset = [this] {
    std::filesystem::remove_all(device());
    std::filesystem::copy(path("original"), device(), std::filesystem::copy_options::recursive);
  };
  killAtEachStep(7, 50, reset, syncWithRemoval, [&] {
    const Finished again = syncWithRemoval({});
    ASSERT_EQ(again.status, 0) << again.err;
    ASSERT_EQ(state(), undisturbed);
  });
}

class Interrupt : public ToolFixture {
 protected:
  Interrupt() : ToolFixture("--direct") {}
  [[nodiscard]] std::unique_ptr<ToolRun> startSync() const {
    return std::make_unique<ToolRun>(std::vector<std::string>{"sync", device(), library(), "--json"});
  }
  /// Starts a sync that never ends: the home screen does not release the app.
  [[nodiscard]] std::unique_ptr<ToolRun> endlessSync(const std::string& version = "1.0") {
    publish("org.held", version);
    EXPECT_EQ(runTool({"set", device(), "assertion=org.held:denied"}).status, 0);
    auto run = startSync();
    EXPECT_TRUE(run->writes("\"event\""));
    return run;
  }
  /// Interrupts the sync once its install waits for a retry.
  void interruptWhileItWaits(ToolRun& run) {
    ASSERT_TRUE(run.writes(kWaits));
    run.signal(SIGINT);
    ASSERT_TRUE(run.ends());
    const Finished ended = run.wait();
    EXPECT_EQ(ended.status, 1);
    EXPECT_THAT(ended.err, HasSubstr("interrupted; finishing the installs of sent packages"));
    EXPECT_THAT(endsIn(ended.out), ElementsAre("failed org.held"));
    EXPECT_THAT(ended.out, HasSubstr("the sync was interrupted; the app is offered again at the next sync"));
  }
  void letGoOfTheApp() const { ASSERT_EQ(runTool({"set", device(), "assertion=org.held:unset"}).status, 0); }
  void expectTheNextSyncBrings(const std::string& app) const {
    EXPECT_EQ(sync().status, 0);
    EXPECT_THAT(apps(), ElementsAre(app));
  }

  static constexpr std::string_view kWaits = R"({"event":"waiting","identifier":"org.held")";
};

TEST_F(Interrupt, OnceEndsWaitingSync) {
  interruptWhileItWaits(*endlessSync());
  letGoOfTheApp();
  expectTheNextSyncBrings("org.held 1.0");
}

TEST_F(Interrupt, OnceKeepsAppWhoseUpdateWaits) {
  publish("org.held");
  ASSERT_EQ(sync().status, 0);
  interruptWhileItWaits(*endlessSync("2.0"));
  letGoOfTheApp();
  EXPECT_THAT(apps(), ElementsAre("org.held 1.0"));
  expectTheNextSyncBrings("org.held 2.0");
}

TEST_F(Interrupt, TwiceEndsTheProcess) {
  const auto run = endlessSync();
  // Both signals arrive while the process is stopped, in any order: after one alone the sync could end.
  for (const int signal : {SIGSTOP, SIGTERM, SIGINT, SIGCONT})
    run->signal(signal);
  ASSERT_TRUE(run->ends());
  EXPECT_THAT(run->wait().status, AnyOf(-SIGINT, -SIGTERM));
  letGoOfTheApp();
  expectTheNextSyncBrings("org.held 1.0");
}

TEST_F(Interrupt, ReportsWaitForTheHomeScreen) {
  const auto run = endlessSync();
  EXPECT_TRUE(run->writes(kWaits));
}

TEST_F(Interrupt, RefusesSecondProcess) {
  const auto first = endlessSync();
  const Finished second = sync();
  EXPECT_EQ(second.status, 3);
  EXPECT_THAT(second.err, HasSubstr("another process"));
  EXPECT_EQ(runTool({"set", device(), "app-removal=no"}).status, 3);
  EXPECT_EQ(runTool({"clear", device()}).status, 3);
}

TEST_F(Interrupt, ListsAppsDuringSync) {
  const auto first = endlessSync();
  EXPECT_THAT(apps(), ElementsAre("org.held 1.0?"));
  EXPECT_EQ(runTool({"screen", device(), "-o", path("screen.png")}).status, 0);
  EXPECT_EQ(runTool({"history", device()}).status, 0);
}

class Outputs : public ToolFixture {};

TEST_F(Outputs, ClosedPipeDoesNotEndTheSync) {
  publish("org.a");
  EXPECT_EQ(sync({"--json"}, {.output = OutputTo::closedPipe}).status, 0);
  EXPECT_EQ(apps().size(), 1U);
}

TEST_F(Outputs, ReportsFullDiskAfterTheSync) {
  publish("org.a");
  const Finished run = sync({}, {.output = OutputTo::full});
  EXPECT_EQ(run.status, 3);
  EXPECT_THAT(run.err, HasSubstr("standard output cannot be written"));
  EXPECT_EQ(apps().size(), 1U);
}

TEST_F(Outputs, ClosedPipeIsNoError) {
  for (const char* command : {"apps", "history"}) {
    EXPECT_EQ(runTool({command, device(), "--json"}, {.output = OutputTo::closedPipe}).status, 0);
  }
}

}  // namespace

}  // namespace appsync::test
