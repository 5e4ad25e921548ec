// Standard output and standard error of commands.
#pragma once

#include <string>
#include <string_view>

#include "base/Error.h"
#include "cli/ExitStatus.h"

namespace appsync::cli {

/// Buffered standard output. If the reader closes the pipe early, further output is discarded without an error and the
/// command completes. `finish` reports any other failure. Not thread-safe.
class StandardOutput {
 public:
  StandardOutput() = default;
  ~StandardOutput() { flush(); }
  StandardOutput(const StandardOutput&) = delete;
  StandardOutput& operator=(const StandardOutput&) = delete;

  /// Adds text. Writes the buffer when it is full.
  void write(std::string_view text);
  /// Adds text and a line end. Writes the buffer when it is full.
  void writeLine(std::string_view text);
  /// Writes the buffer.
  void flush();
  /// Flushes and returns `status`, or reports an error and returns `unusable` if output could not be written.
  [[nodiscard]] ExitStatus finish(ExitStatus status);

 private:
  std::string pending_;
  int failure_ = 0;  // errno of the first failed write, after which nothing is written
};

/// Returns whether `path` is standard output and that is a terminal, and then reports on standard error that it cannot
/// show `what`.
[[nodiscard]] bool isForTerminal(const std::string& path, std::string_view what);

/// Writes "appsync: " and the sentence to standard error. `sentence` may contain untrusted text.
void printError(std::string_view sentence);

/// Writes the error's text like `printError` and returns `unusable`.
[[nodiscard]] ExitStatus reportUnusable(const Error& error);

}  // namespace appsync::cli
