#include "tools/StandardOutput.h"

#include <cerrno>

#include <unistd.h>

#include "device/HostFile.h"
#include "tools/Printable.h"

namespace appsync::tools {
namespace {

constexpr std::size_t kLargestBuffer = std::size_t{64} * 1024;
constexpr std::size_t kLongestSentence = 2000;

/// 0, or the errno that stopped it.
int writeAll(int descriptor, std::string_view text) {
  while (!text.empty()) {
    const ssize_t written = ::write(descriptor, text.data(), text.size());
    if (written < 0 && errno != EINTR) return errno;
    if (written > 0) text.remove_prefix(static_cast<std::size_t>(written));
  }
  return 0;
}

}  // namespace

void StandardOutput::write(std::string_view text) {
  pending_ += text;
  if (pending_.size() >= kLargestBuffer) flush();
}

void StandardOutput::writeLine(std::string_view text) {
  pending_.append(text).push_back('\n');
  if (pending_.size() >= kLargestBuffer) flush();
}

void StandardOutput::flush() {
  if (failure_ == 0) failure_ = writeAll(STDOUT_FILENO, pending_);
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
  // Nobody is left to tell when standard error fails too.
  static_cast<void>(writeAll(STDERR_FILENO, "appsync: " + printable(sentence, kLongestSentence) + "\n"));
}

ExitStatus reportUnusable(const Error& error) {
  printError(error.text);
  return ExitStatus::unusable;
}

}  // namespace appsync::tools
