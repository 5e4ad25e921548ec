// Logging.
#pragma once

#include <string_view>
#include <type_traits>

#include "base/Message.h"

namespace appsync {

enum class LogLevel {
  standard,  ///< Progress; called "default" in logs.
  error,     ///< Failures.
};

/// One category of a log. Thread-safe.
class LogCategory {
 public:
  virtual ~LogCategory() = default;

  /// Whether messages of `level` are written. Called before each message, so it must be cheap.
  virtual bool isEnabled(LogLevel level) const noexcept = 0;

  /// Writes one message. Messages of log() are one line of printable text without a line end, whatever values they
  /// print, so implementations must not escape them again. `message` is valid during the call only.
  virtual void write(LogLevel level, std::string_view message) = 0;
};

/// Formats and writes a message (see appendMessage) if `level` is enabled; else nothing is formatted.
template <class... Args>
void log(LogCategory& category, LogLevel level, MessageFormat<std::type_identity_t<Args>...> format,
         const Args&... args) {
  if (category.isEnabled(level)) category.write(level, formatMessage<Args...>(format, args...));
}

}  // namespace appsync
