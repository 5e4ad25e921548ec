// Standard output and standard error, as commands use them.
#pragma once

#include <string>
#include <string_view>

#include "base/Error.h"
#include "cli/ExitStatus.h"

namespace appsync::cli {

/// Standard output with a buffer. A reader that closes its end early is no failure: the rest goes nowhere, and the
/// command does its work to the end. Any other failure is reported once, by `finish`. One thread at a time.
class StandardOutput {
 public:
  StandardOutput() = default;
  ~StandardOutput() { flush(); }
  StandardOutput(const StandardOutput&) = delete;
  StandardOutput& operator=(const StandardOutput&) = delete;

  /// Adds text; what piles up is written on the way.
  void write(std::string_view text);
  /// Adds text and a line end.
  void writeLine(std::string_view text);
  /// Hands everything on to the reader.
  void flush();
  /// Flushes, and returns `status`, or `unusable` with a message if something could not be written.
  [[nodiscard]] ExitStatus finish(ExitStatus status);

 private:
  std::string pending_;
  int failure_ = 0;  // errno of the first write that failed; nothing is written after it
};

/// Whether bytes that only programs read, named `what`, would go to a terminal when `path` is where they are written.
/// Then what to do instead is told on standard error.
[[nodiscard]] bool isForTerminal(const std::string& path, std::string_view what);

/// Writes "appsync: " and the sentence to standard error. `sentence` may hold names from outside.
void printError(std::string_view sentence);

/// The same for what went wrong with a device, library or file. Returns `unusable`.
[[nodiscard]] ExitStatus reportUnusable(const Error& error);

}  // namespace appsync::cli
