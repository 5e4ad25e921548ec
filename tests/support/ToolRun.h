// The tool as a process of its own.
#pragma once

#include <map>
#include <string>
#include <string_view>
#include <vector>

#include <sys/types.h>

#include "kit/fakes/TemporaryFolder.h"

namespace appsync::test {

/// What is left of a process: its exit status, or minus the number of the signal that ended it, and what it wrote.
struct Finished {
  int status = 0;
  std::string out;
  std::string err;
};

/// Where a process's standard output goes.
enum class OutputTo { file, closedPipe, full };

struct ToolOptions {
  std::map<std::string, std::string> environment;
  OutputTo output = OutputTo::file;
  std::string input;  ///< what it reads on standard input
};

/// Runs `appsync`, or another program of the PATH, with these words. Killed and waited for at the latest when the
/// object goes.
class ToolRun {
 public:
  explicit ToolRun(const std::vector<std::string>& words, const ToolOptions& options = {},
                   const std::string& program = "appsync");
  ~ToolRun();
  ToolRun(const ToolRun&) = delete;
  ToolRun& operator=(const ToolRun&) = delete;

  void signal(int number) const;
  [[nodiscard]] Finished wait();

  // These block. False when it has ended without, or neither wrote nor ended for a minute.

  /// Until `text` is in what it has written to standard output.
  [[nodiscard]] bool writes(std::string_view text) const;
  /// Until it has ended. It still is to be waited for.
  [[nodiscard]] bool ends() const;

 private:
  TemporaryFolder folder_;
  pid_t process_ = -1;
};

/// Runs it to its end.
[[nodiscard]] Finished runTool(const std::vector<std::string>& words, const ToolOptions& options = {});
/// The same with another program, which finds the tool that is tested on its PATH. Status 127 when there is none.
[[nodiscard]] Finished runProgram(const std::string& program, const std::vector<std::string>& words,
                                  const ToolOptions& options = {});

}  // namespace appsync::test
