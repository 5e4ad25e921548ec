#include <map>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "host/SyncProgress.h"

namespace appsync::host {
namespace {

using testing::ElementsAre;

class Recorder final : public SyncReporter {
 public:
  void progressed(const AppProgress& progress) override {
    fractions[progress.name.identifier].push_back(progress.fraction);
    overall.push_back(progress.overall);
  }
  void waits(const AppName& app, std::string_view /*reason*/) override { waiting.push_back(app.identifier); }
  void interrupted() override { ++interruptions; }
  void warned(std::string_view /*sentence*/) override {}
  void finished(const AppOutcome& outcome) override { ended.push_back(outcome.name.identifier); }
  void summarise(const AppOutcomes& outcomes) override { summarised = outcomes.size(); }

  std::map<std::string, std::vector<double>> fractions;
  std::vector<double> overall;
  std::vector<std::string> waiting;
  std::vector<std::string> ended;
  std::size_t summarised = 0;
  int interruptions = 0;
};

class Progress : public testing::Test {
 protected:
  void expect(const std::string& identifier, std::uint64_t bytes) { progress_.expect({identifier, "", ""}, bytes); }
  bool finish(const std::string& identifier, AppEvent event = AppEvent::installed) {
    return progress_.finish({event, {identifier, "", ""}, "reason"});
  }

  Recorder recorder_;
  SyncProgress progress_{recorder_};
};

TEST_F(Progress, SeparatesAppFromPackageFileOfSameName) {
  expect("a", 1000);
  EXPECT_TRUE(progress_.finish({AppEvent::failed, {"a", "", "", NameKind::packageFile}, "reason"}));
  progress_.installing("a", 0.5);
  EXPECT_EQ(recorder_.fractions["a"].back(), 0.75);
  EXPECT_TRUE(finish("a"));
  EXPECT_FALSE(progress_.finish({AppEvent::failed, {"a", "", "", NameKind::packageFile}, "reason"}));
  EXPECT_EQ(progress_.summarise().size(), 2U);
}

TEST_F(Progress, AppProgressNeverDecreases) {
  expect("a", 1000);
  progress_.installing("a", 0.8);
  progress_.sending("a", 0.1);
  finish("a");
  const auto& fractions = recorder_.fractions["a"];
  EXPECT_TRUE(std::ranges::is_sorted(fractions));
  EXPECT_EQ(fractions.back(), 1.0);
}

TEST_F(Progress, OverallProgressNeverDecreases) {
  expect("a", 1'000'000);
  progress_.installing("a", 0.9);
  expect("b", 9'000'000);
  progress_.sending("b", 0.5);
  progress_.installing("b", 0.0);
  finish("b");
  finish("a");
  EXPECT_TRUE(std::ranges::is_sorted(recorder_.overall));
  EXPECT_EQ(recorder_.overall.back(), 1.0);
}

TEST_F(Progress, LargePackagesWeighMore) {
  expect("small", 0);
  expect("large", 99'900'000);
  finish("small");
  EXPECT_NEAR(recorder_.overall.back(), 0.001, 0.0005);
}

TEST_F(Progress, KeepsOnlyTheFirstOutcome) {
  expect("a", 1);
  EXPECT_TRUE(finish("a"));
  EXPECT_FALSE(finish("a", AppEvent::failed));
  EXPECT_THAT(recorder_.ended, ElementsAre("a"));
  EXPECT_EQ(progress_.summarise().front().event, AppEvent::installed);
}

TEST_F(Progress, FinishExpectedKeepsTheName) {
  progress_.expect({"a", "Notes", "1.0"}, 1);
  progress_.finishExpected("a", AppEvent::skipped, "reason");
  progress_.finishExpected("b", AppEvent::skipped, "reason");
  EXPECT_FALSE(finish("a"));
  const AppOutcomes& outcomes = progress_.summarise();
  ASSERT_EQ(outcomes.size(), 1U);
  EXPECT_EQ(outcomes[0].name.name, "Notes");
  EXPECT_EQ(outcomes[0].event, AppEvent::skipped);
  EXPECT_EQ(outcomes[0].reason, "reason");
}

TEST_F(Progress, FailureDoesNotReportCompletion) {
  expect("a", 1);
  finish("a", AppEvent::failed);
  EXPECT_TRUE(recorder_.fractions["a"].empty());
}

TEST_F(Progress, LimitsTheRateOfReports) {
  expect("a", 1);
  for (int step = 0; step <= 10'000; ++step)
    progress_.sending("a", step / 10'000.0);
  EXPECT_LE(recorder_.fractions["a"].size(), 50U);
}

TEST_F(Progress, IgnoresUnknownApps) {
  progress_.sending("b", 0.5);
  progress_.waits("b", "reason");
  EXPECT_TRUE(recorder_.fractions.empty());
  EXPECT_TRUE(recorder_.waiting.empty());
}

TEST_F(Progress, ReportsWaitOnce) {
  expect("a", 1);
  progress_.waits("a", "reason");
  progress_.waits("a", "reason");
  EXPECT_THAT(recorder_.waiting, ElementsAre("a"));
}

TEST_F(Progress, ReportsInterruptionOnce) {
  progress_.interrupted();
  progress_.interrupted();
  EXPECT_EQ(recorder_.interruptions, 1);
}

TEST_F(Progress, SummaryHasOutcomesInOrder) {
  expect("a", 1);
  finish("b", AppEvent::skipped);
  finish("a");
  const AppOutcomes& outcomes = progress_.summarise();
  EXPECT_EQ(recorder_.summarised, 2U);
  EXPECT_EQ(outcomes[0].name.identifier, "b");
  EXPECT_EQ(outcomes[1].name.identifier, "a");
}

}  // namespace
}  // namespace appsync::host
