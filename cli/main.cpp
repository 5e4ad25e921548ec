// appsync: syncs the apps on a device with a library, as host and sync daemon in one process.
#include <clocale>
#include <csignal>
#include <exception>

#include <fcntl.h>
#include <unistd.h>

#include "cli/CommandLine.h"
#include "cli/StandardOutput.h"

namespace {

/// Opens closed standard streams on /dev/null, so that no file of a device gets their descriptors and receives
/// messages. Reading and writing them still fails.
void occupyStandardStreams() {
  for (const int stream : {STDIN_FILENO, STDOUT_FILENO, STDERR_FILENO}) {
    const bool isClosed = ::fcntl(stream, F_GETFD) < 0;
    if (isClosed && ::open("/dev/null", stream == STDIN_FILENO ? O_WRONLY : O_RDONLY) != stream) return;
  }
}

}  // namespace

int main(int count, char** words) {
  using namespace appsync::cli;
  occupyStandardStreams();
  // wcwidth needs a UTF-8 locale for the width of names on a terminal.
  if (std::setlocale(LC_CTYPE, "") == nullptr || MB_CUR_MAX == 1) std::setlocale(LC_CTYPE, "C.UTF-8");
  // A reader that closes the pipe early must not end the sync; the write fails instead.
  std::signal(SIGPIPE, SIG_IGN);
  try {
    return static_cast<int>(runCommandLine(count, words));
  } catch (const std::exception& failure) {
    printError(std::string("internal error: ") + failure.what());
    return static_cast<int>(ExitStatus::unusable);
  }
}
