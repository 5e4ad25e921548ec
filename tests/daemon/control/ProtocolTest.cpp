#include <string>

#include <gtest/gtest.h>

#include "daemon/control/Protocol.h"

namespace appsync::daemon {
namespace {

TEST(ControlProtocol, RequestsRoundTrip) {
  EXPECT_EQ(lineOf(ControlRequest{ControlVerb::prioritize, "org.a"}), "prioritize org.a\n");
  EXPECT_EQ(lineOf(ControlRequest{ControlVerb::cancel, "org.a"}), "cancel org.a\n");
  EXPECT_EQ(readRequest("prioritize org.a"), (ControlRequest{ControlVerb::prioritize, "org.a"}));
  EXPECT_EQ(readRequest("cancel org.a"), (ControlRequest{ControlVerb::cancel, "org.a"}));
}

TEST(ControlProtocol, AnswersRoundTrip) {
  EXPECT_EQ(lineOf(ControlAnswer{ControlResult::done, {}}), "done\n");
  EXPECT_EQ(lineOf(ControlAnswer{ControlResult::refused, "not now"}), "refused not now\n");
  EXPECT_EQ(readAnswer("done"), (ControlAnswer{ControlResult::done, {}}));
  EXPECT_EQ(readAnswer("refused not now"), (ControlAnswer{ControlResult::refused, "not now"}));
  EXPECT_EQ(readAnswer("error what"), (ControlAnswer{ControlResult::error, "what"}));
}

TEST(ControlProtocol, RejectsInvalidRequests) {
  using namespace std::string_literals;
  const std::string requests[] = {"",
                                  "cancel",
                                  "cancel ",
                                  " cancel org.a",
                                  "cancel  org.a",
                                  "cancel org.a ",
                                  "cancel org.a org.b",
                                  "CANCEL org.a",
                                  "remove org.a",
                                  "cancel ../../etc",
                                  "cancel .hidden",
                                  "cancel org.\x1b[2J",
                                  "cancel org.\xff",
                                  "cancel org.\0a"s,
                                  "cancel org.a\r",
                                  "cancel " + std::string(900, 'a')};
  for (const std::string& request : requests)
    EXPECT_FALSE(readRequest(request)) << request;
}

TEST(ControlProtocol, RejectsInvalidAnswers) {
  for (const char* answer : {"", "ok", "Done", " done", "donee"})
    EXPECT_FALSE(readAnswer(answer)) << answer;
}

TEST(ControlProtocol, TruncatesLongAnswer) {
  const std::string line = lineOf(ControlAnswer{ControlResult::error, "first\n" + std::string(5000, 'x')});
  EXPECT_EQ(line.size(), kLongestControlLine);
  EXPECT_EQ(line.find('\n'), line.size() - 1);
  EXPECT_TRUE(line.starts_with("error first xxx"));
}

}  // namespace
}  // namespace appsync::daemon
