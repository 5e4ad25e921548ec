#include "cli/StandardOutput.h"

#include <cerrno>

#include <unistd.h>

#include "cli/Printable.h"
#include "device/storage/HostFile.h"

namespace appsync::cli {
namespace {

constexpr std::size_t kBufferSize = std::size_t{64} * 1024;
constexpr std::size_t kMaximumSentence = 2000;

}  // namespace

void StandardOutput::write(std::string_view text) {
  pending_ += text;
  if (pending_.size() >= kBufferSize) flush();
}

void StandardOutput::writeLine(std::string_view text) {
  pending_.append(text).push_back('\n');
  if (pending_.size() >= kBufferSize) flush();
}

void StandardOutput::flush() {
  if (failure_ == 0) failure_ = device::writeAll(STDOUT_FILENO, bytesOf(pending_));
  pending_.clear();
}

ExitStatus StandardOutput::finish(ExitStatus status) {
  flush();
  if (failure_ == 0 || failure_ == EPIPE) return status;
  return reportUnusable(Error::fromErrno(failure_, "standard output cannot be written"));
}

bool isForTerminal(const std::string& path, std::string_view what) {
  if (path != device::kStandardStream || ::isatty(STDOUT_FILENO) != 1) return false;
  printError("a terminal cannot show " + std::string(what) + "; name a file with -o");
  return true;
}

void printError(std::string_view sentence) {
  const std::string line = "appsync: " + printable(sentence, kMaximumSentence) + "\n";
  // If standard error fails, too, there is no way left to report it.
  static_cast<void>(device::writeAll(STDERR_FILENO, bytesOf(line)));
}

ExitStatus reportUnusable(const Error& error) {
  printError(error.text);
  return ExitStatus::unusable;
}

}  // namespace appsync::cli
