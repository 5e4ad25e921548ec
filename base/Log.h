// Where messages go.
#pragma once

#include <string_view>
#include <type_traits>

#include "base/Message.h"

namespace appsync {

enum class LogLevel {
  standard,  ///< The course of work; logs call it "default".
  error,     ///< Failures.
};

/// One category of a log. All operations may be called on any thread, at any time.
class LogCategory {
 public:
  virtual ~LogCategory() = default;

  /// Whether messages of `level` are wanted now. Asked before each message, so it must be cheap.
  virtual bool isEnabled(LogLevel level) const noexcept = 0;

  /// Takes one message. Messages of log() are one line of printable text without a line end, whatever they print: a sink
  /// writes them as they are, without escaping. `message` is valid during the call only.
  virtual void write(LogLevel level, std::string_view message) = 0;
};

/// Writes a message, see formatMessage, if its level is enabled; else nothing is formatted.
template <class... Args>
void log(LogCategory& category, LogLevel level, MessageFormat<std::type_identity_t<Args>...> format,
         const Args&... args) {
  if (category.isEnabled(level)) category.write(level, formatMessage<Args...>(format, args...));
}

}  // namespace appsync
