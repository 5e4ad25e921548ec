// appsync: keeps apps on a device in step with a library, as host and sync daemon in one process.
#include <clocale>
#include <csignal>
#include <exception>

#include <fcntl.h>
#include <unistd.h>

#include "cli/CommandLine.h"
#include "cli/StandardOutput.h"

namespace {

/// Takes the numbers of standard streams that are closed, so that no file of a device gets one of them, and with it
/// what is said to people. Reading and writing them stays a failure.
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
  // Names in any script have their right width on a terminal, whatever the environment says.
  if (std::setlocale(LC_CTYPE, "") == nullptr || MB_CUR_MAX == 1) std::setlocale(LC_CTYPE, "C.UTF-8");
  // A reader that leaves early is an error of a write, not the end of a sync.
  std::signal(SIGPIPE, SIG_IGN);
  try {
    return static_cast<int>(runCommandLine(count, words));
  } catch (const std::exception& failure) {
    printError(std::string("gave up: ") + failure.what());
    return static_cast<int>(ExitStatus::unusable);
  }
}
