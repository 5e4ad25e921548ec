// A sync that is ended from outside at any moment, and what the next one makes of it.
#include <csignal>
#include <cstdlib>
#include <fstream>
#include <iterator>
#include <memory>

#include <gmock/gmock.h>

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
  [[nodiscard]] Finished disturbedSync(long step) const {
    return sync({"--remove", "org.remove"},
                {.environment = {{"APPSYNC_KILL_AT", std::to_string(step)}}, .output = OutputTo::file, .input = {}});
  }
  /// What must be the same however the device came to it.
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

/// With APPSYNC_EVERY_STEP in the environment at really every one, which takes a minute.
TEST_P(Kill, AtAnyStepTheNextSyncEndsAsIfUndisturbed) {
  prepare();
  std::filesystem::copy(device(), path("original"), std::filesystem::copy_options::recursive);
  ASSERT_EQ(sync({"--remove", "org.remove"}).status, 0);
  const std::vector<std::string> undisturbed = state();
  EXPECT_THAT(undisturbed, Contains("org.update 2.0"));

  constexpr long kMostSteps = 3000;
  const long stride = std::getenv("APPSYNC_EVERY_STEP") == nullptr ? 7 : 1;
  long step = 1;
  for (; step < kMostSteps; step += stride) {
    std::filesystem::remove_all(device());
    std::filesystem::copy(path("original"), device(), std::filesystem::copy_options::recursive);
    const Finished killed = disturbedSync(step);
    if (killed.status == 0) break;  // it needs no more steps than that
    ASSERT_EQ(killed.status, -SIGKILL) << killed.err;
    const Finished again = sync({"--remove", "org.remove"});
    ASSERT_EQ(again.status, 0) << "step " << step << ": " << again.err;
    ASSERT_EQ(state(), undisturbed) << "step " << step;
  }
  EXPECT_GT(step, 50);
  EXPECT_LT(step, kMostSteps);
}

class Interrupt : public ToolFixture {
 protected:
  Interrupt() : ToolFixture("--direct") {}
  [[nodiscard]] std::unique_ptr<ToolRun> startSync() const {
    return std::make_unique<ToolRun>(std::vector<std::string>{"sync", device(), library(), "--json"});
  }
  /// A sync that does not come to its end by itself: the home screen does not let go of the app.
  [[nodiscard]] std::unique_ptr<ToolRun> endlessSync(const std::string& version = "1.0") {
    publish("org.held", version);
    EXPECT_EQ(runTool({"set", device(), "assertion=org.held:denied"}).status, 0);
    auto run = startSync();
    EXPECT_TRUE(run->writes("\"event\""));
    return run;
  }
  /// Interrupts it once, when the install is surely waiting to be tried again.
  void interruptWhileItWaits(ToolRun& run) {
    ASSERT_TRUE(run.writes(kWaits));
    run.signal(SIGINT);
    ASSERT_TRUE(run.ends());
    const Finished ended = run.wait();
    EXPECT_EQ(ended.status, 1);
    EXPECT_THAT(ended.err, HasSubstr("interrupted; finishing what was sent already"));
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

TEST_F(Interrupt, OnceEndsASyncThatWaitsForTheHomeScreen) {
  interruptWhileItWaits(*endlessSync());
  letGoOfTheApp();
  expectTheNextSyncBrings("org.held 1.0");
}

TEST_F(Interrupt, OnceLeavesTheAppWhoseUpdateWaitsForTheHomeScreen) {
  publish("org.held");
  ASSERT_EQ(sync().status, 0);
  interruptWhileItWaits(*endlessSync("2.0"));
  letGoOfTheApp();
  EXPECT_THAT(apps(), ElementsAre("org.held 1.0"));
  expectTheNextSyncBrings("org.held 2.0");
}

TEST_F(Interrupt, TwiceEndsItAtOnce) {
  const auto run = endlessSync();
  // Both while it stands still: one would let it come to its end. Which of them comes second is the system's choice.
  for (const int signal : {SIGSTOP, SIGTERM, SIGINT, SIGCONT})
    run->signal(signal);
  ASSERT_TRUE(run->ends());
  EXPECT_THAT(run->wait().status, AnyOf(-SIGINT, -SIGTERM));
  letGoOfTheApp();
  expectTheNextSyncBrings("org.held 1.0");
}

TEST_F(Interrupt, ASyncThatWaitsForTheHomeScreenSaysSo) {
  const auto run = endlessSync();
  EXPECT_TRUE(run->writes(kWaits));
}

TEST_F(Interrupt, ASecondProcessIsToldThatTheDeviceIsHeld) {
  const auto first = endlessSync();
  const Finished second = sync();
  EXPECT_EQ(second.status, 3);
  EXPECT_THAT(second.err, HasSubstr("another process"));
  EXPECT_EQ(runTool({"set", device(), "app-removal=no"}).status, 3);
  EXPECT_EQ(runTool({"clear", device()}).status, 3);
}

TEST_F(Interrupt, TheAppsOfARunningSyncCanBeLookedAt) {
  const auto first = endlessSync();
  EXPECT_THAT(apps(), ElementsAre("org.held 1.0?"));
  EXPECT_EQ(runTool({"screen", device(), "-o", path("screen.png")}).status, 0);
  EXPECT_EQ(runTool({"history", device()}).status, 0);
}

class Outputs : public ToolFixture {};

TEST_F(Outputs, AReaderThatLeavesDoesNotEndTheSync) {
  publish("org.a");
  EXPECT_EQ(sync({"--json"}, {.environment = {}, .output = OutputTo::closedPipe, .input = {}}).status, 0);
  EXPECT_EQ(apps().size(), 1U);
}

TEST_F(Outputs, AFullDiskBehindTheOutputIsToldAfterTheSync) {
  publish("org.a");
  const Finished run = sync({}, {.environment = {}, .output = OutputTo::full, .input = {}});
  EXPECT_EQ(run.status, 3);
  EXPECT_THAT(run.err, HasSubstr("standard output cannot be written"));
  EXPECT_EQ(apps().size(), 1U);
}

TEST_F(Outputs, AListForAReaderThatLeftIsNoFailure) {
  for (const char* command : {"apps", "history"}) {
    EXPECT_EQ(
        runTool({command, device(), "--json"}, {.environment = {}, .output = OutputTo::closedPipe, .input = {}}).status,
        0);
  }
}

}  // namespace

}  // namespace appsync::test
