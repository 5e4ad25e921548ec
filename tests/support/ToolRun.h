// The tool as a child process.
#pragma once

#include <map>
#include <string>
#include <string_view>
#include <vector>

#include <sys/types.h>

#include "kit/fakes/TemporaryFolder.h"

namespace appsync::test {

/// The result of a process: its exit status, or minus the number of the signal that ended it, and its output.
struct Finished {
  int status = 0;
  std::string out;
  std::string err;
};

/// The target of a process's standard output.
enum class OutputTo { file, closedPipe, full };

struct ToolOptions {
  std::map<std::string, std::string> environment = {};
  OutputTo output = OutputTo::file;
  std::string input = {};  ///< content of standard input
};

/// Returns options for a run of the tool that is killed before its step number `step`.
[[nodiscard]] inline ToolOptions killedAt(long step) {
  return {.environment = {{"APPSYNC_KILL_AT", std::to_string(step)}}};
}

/// Runs `appsync`, or another program of the PATH, with these words. The destructor kills the process and waits for its
/// end.
class ToolRun {
 public:
  explicit ToolRun(const std::vector<std::string>& words, const ToolOptions& options = {},
                   const std::string& program = "appsync");
  ~ToolRun();
  ToolRun(const ToolRun&) = delete;
  ToolRun& operator=(const ToolRun&) = delete;

  void signal(int number) const;
  [[nodiscard]] Finished wait();

  // These block, and return false if the process ended without it or made no output for a minute.

  /// Blocks until standard output contains `text`.
  [[nodiscard]] bool writes(std::string_view text) const;
  /// Blocks until the process has ended. `wait` must still be called.
  [[nodiscard]] bool ends() const;

 private:
  TemporaryFolder folder_;
  pid_t process_ = -1;
};

/// Runs the tool to its end.
[[nodiscard]] Finished runTool(const std::vector<std::string>& words, const ToolOptions& options = {});
/// Runs another program to its end; its PATH contains the tested tool. Status 127 if the program does not exist.
[[nodiscard]] Finished runProgram(const std::string& program, const std::vector<std::string>& words,
                                  const ToolOptions& options = {});

}  // namespace appsync::test
