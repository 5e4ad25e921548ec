// Calls whose failure fails a coordinated preparation, and what is to be seen of it.
#pragma once

#include <cstddef>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "base/Describe.h"
#include "kit/fakes/CallsInLog.h"
#include "kit/fakes/FakePlatform.h"

namespace appsync::test {

/// A call whose failure fails the preparation.
struct FatalCall {
  using Strings = std::vector<std::string>;

  const char* operation;
  const char* subject;
  /// What is logged as an error; "%" stands for the service's error.
  Strings complaints;
  /// Whether the service's error is the one that the preparation ends with.
  bool endsWithError;
  /// What is cancelled, in order, as journal lines.
  Strings cancelled;
  /// Whether the app was awaited by then.
  bool wasAwaited = false;

  void failNext(FakePlatform& platform, const Error& error) const {
    platform.coordination.failures.failNext(operation, subject, error);
  }

  void expectComplaints(const RecordingLog& log, const Error& error) const {
    Strings found;
    for (const LogLine& line : log.lines()) {
      if (line.level == LogLevel::error) found.push_back(line.text.substr(line.text.find('|') + 1));
    }
    Strings expected = complaints;
    for (std::string& complaint : expected) {
      const auto at = complaint.find('%');
      if (at != std::string::npos) complaint.replace(at, 1, description(error));
    }
    EXPECT_EQ(found, expected);
  }

  void expectCancellations(const CallJournal& journal) const {
    EXPECT_EQ(journal.lines({"coordinator.cancelForReason", "placeholder.cancelForReason", "promise.cancelForReason"}),
              cancelled);
  }
};

/// The call's name without its service's.
inline std::string nameOfCall(const testing::TestParamInfo<FatalCall>& info) {
  const std::string name = info.param.operation;
  return name.substr(name.find('.') + 1) + (std::string(info.param.subject) == "com.a-Icon" ? "Icon" : "");
}

/// Whether the lines end with those.
inline void expectEnd(const LogLines& expected, const LogLines& lines) {
  ASSERT_GE(lines.size(), expected.size());
  EXPECT_TRUE(sameLines(expected, {lines.end() - static_cast<std::ptrdiff_t>(expected.size()), lines.end()}));
}

}  // namespace appsync::test
