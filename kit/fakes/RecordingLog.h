// A log that records every line.
#pragma once

#include <map>
#include <memory>
#include <mutex>
#include <ostream>
#include <set>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "base/Log.h"

namespace appsync::test {

struct LogLine {
  int category = 8;
  LogLevel level = LogLevel::standard;
  std::string text;
  bool operator==(const LogLine&) const = default;
};
std::ostream& operator<<(std::ostream& out, const LogLine& line);

using LogLines = std::vector<LogLine>;

/// Return a line of the plug-in, for comparison. `text` omits the plug-in's identifier and bar.
[[nodiscard]] LogLine logged(std::string_view text);                  ///< category 8, default level
[[nodiscard]] LogLine loggedError(std::string_view text);             ///< category 8, error level
[[nodiscard]] LogLine loggedIn(int category, std::string_view text);  ///< default level

/// The categories of a sync framework's log, initially all enabled. Thread-safe.
class RecordingLog {
 public:
  /// Returns a category, created on first use, which lives as long as the log.
  [[nodiscard]] LogCategory& category(int number);

  void enable(int category, LogLevel level);
  void disable(int category, LogLevel level);
  void disable(int category);  ///< at all levels

  /// Return all lines, or those of a category, in order.
  [[nodiscard]] LogLines lines() const;
  [[nodiscard]] LogLines lines(int category) const;
  /// Returns the texts of the lines, without the plug-in's identifier and bar.
  [[nodiscard]] std::vector<std::string> messages() const;
  [[nodiscard]] std::vector<std::string> messages(int category) const;
  [[nodiscard]] bool contains(const LogLine& line) const;
  void clear();

 private:
  class Category;

  void write(int category, LogLevel level, std::string_view text);
  [[nodiscard]] bool isEnabled(int category, LogLevel level) const;

  mutable std::mutex mutex_;
  std::map<int, std::unique_ptr<LogCategory>> categories_;
  std::set<std::pair<int, LogLevel>> disabled_;
  LogLines lines_;
};

/// Succeeds if both are equal, else shows missing and unexpected lines.
[[nodiscard]] testing::AssertionResult sameLines(const LogLines& expected, const LogLines& actual);

}  // namespace appsync::test
