// The reports of a sync for users and programs.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "cli/Json.h"
#include "cli/ReportText.h"
#include "cli/Reporters.h"

namespace appsync::cli {
namespace {

using testing::internal::CaptureStdout;
using testing::internal::GetCapturedStdout;

const host::AppName kTides = {"org.example.tides", "Tides", "1.2"};

host::AppOutcome outcome(host::AppEvent event, std::string reason = {}) {
  return {event, kTides, std::move(reason)};
}

TEST(ReportLines, SuccessIsOneLine) {
  EXPECT_EQ(outcomeLine(outcome(host::AppEvent::installed)), "installed  Tides 1.2");
}

TEST(ReportLines, UnchangedAppHasNoLine) {
  EXPECT_EQ(outcomeLine(outcome(host::AppEvent::unchanged)), "");
}

TEST(ReportLines, SkippedAppHasReason) {
  EXPECT_EQ(outcomeLine(outcome(host::AppEvent::skipped, "it is raining")), "skipped    Tides 1.2: it is raining");
}

TEST(ReportLines, FailureNamesAppAndReason) {
  EXPECT_EQ(failureSentence(outcome(host::AppEvent::failed, "it is damaged")),
            "Tides 1.2 (org.example.tides) failed: it is damaged");
}

TEST(ReportLines, ShowsIdentifierOfUnnamedApp) {
  EXPECT_EQ(failureSentence({host::AppEvent::failed, {"broken.zip", "", ""}, "it is damaged"}),
            "broken.zip failed: it is damaged");
}

TEST(ReportLines, EscapesNames) {
  EXPECT_EQ(outcomeLine({host::AppEvent::installed, {"id", "\x1b[31m\nred", ""}, {}}), "installed  \\x1b[31m\\x0ared");
}

TEST(ReportLines, CutsLongName) {
  EXPECT_LT(outcomeLine({host::AppEvent::installed, {"id", std::string(65536, 'x'), "1"}, {}}).size(), 100U);
}

TEST(ReportLines, SummaryCountsEveryOutcome) {
  EXPECT_EQ(summaryLine({outcome(host::AppEvent::installed), outcome(host::AppEvent::installed),
                         outcome(host::AppEvent::failed), outcome(host::AppEvent::unchanged)}),
            "2 installed, 1 failed, 1 up to date.");
}

TEST(ReportLines, SummaryOfNoWork) {
  EXPECT_EQ(summaryLine({outcome(host::AppEvent::unchanged)}), "Nothing to do: 1 up to date.");
  EXPECT_EQ(summaryLine({}), "Nothing to do.");
}

std::vector<Json> linesOf(const std::string& text) {
  std::vector<Json> lines;
  for (std::size_t start = 0; start < text.size();) {
    const std::size_t end = text.find('\n', start);
    lines.push_back(Json::parse(text.substr(start, end - start)));
    start = end + 1;
  }
  return lines;
}

TEST(JsonReporter, WritesOneObjectPerLine) {
  CaptureStdout();
  {
    StandardOutput output;
    const auto reporter = makeJsonReporter(output, host::OperationKind::sync);
    reporter->progressed({kTides, host::AppStage::sending, 0.25, 0.1, 0, 1});
    reporter->finished(outcome(host::AppEvent::failed, "it is damaged"));
    reporter->summarise({outcome(host::AppEvent::failed, "it is damaged"), outcome(host::AppEvent::unchanged)});
  }
  const auto lines = linesOf(GetCapturedStdout());
  ASSERT_EQ(lines.size(), 3U);
  EXPECT_EQ(onOneLine(lines[0]), R"({"event":"progress","identifier":"org.example.tides","fraction":0.25})");
  EXPECT_EQ(onOneLine(lines[1]), R"({"event":"failed","identifier":"org.example.tides","name":"Tides","version":"1.2",)"
                                 R"("reason":"it is damaged"})");
  EXPECT_EQ(onOneLine(lines[2]),
            R"({"event":"summary","installed":[],"updated":[],"removed":[],"failed":["org.example.tides"],)"
            R"("skipped":["org.example.tides"]})");
}

TEST(JsonReporter, EscapesHostileNames) {
  CaptureStdout();
  {
    StandardOutput output;
    makeJsonReporter(output, host::OperationKind::sync)
        ->finished({host::AppEvent::failed, {"\xff\"\n", std::string(1, '\0'), ""}, "\x1b"});
  }
  EXPECT_EQ(linesOf(GetCapturedStdout()).size(), 1U);
}

TEST(PlainReporter, DoesNotShowProgress) {
  CaptureStdout();
  {
    StandardOutput output;
    const auto reporter = makePlainReporter(output);
    reporter->progressed({kTides, host::AppStage::sending, 0.25, 0.1, 0, 1});
    reporter->finished(outcome(host::AppEvent::updated));
    reporter->summarise({outcome(host::AppEvent::updated)});
  }
  EXPECT_EQ(GetCapturedStdout(), "updated    Tides 1.2\n1 updated.\n");
}

TEST(TerminalReporter, ErasesExactlyItsLines) {
  CaptureStdout();
  {
    StandardOutput output;
    const auto reporter = makeTerminalReporter(output);
    reporter->progressed({kTides, host::AppStage::sending, 0.25, 0.1, 0, 1});
    reporter->finished(outcome(host::AppEvent::installed));
    reporter->summarise({outcome(host::AppEvent::installed)});
  }
  const std::string text = GetCapturedStdout();
  EXPECT_NE(text.find("sending"), std::string::npos);
  EXPECT_NE(text.find("\r\x1b[2A\x1b[Jinstalled  Tides 1.2\n"), std::string::npos);
  EXPECT_TRUE(text.ends_with("\r\x1b[1A\x1b[J1 installed.\n")) << text;
}

}  // namespace
}  // namespace appsync::cli
