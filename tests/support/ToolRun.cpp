#include "tests/support/ToolRun.h"

#include <csignal>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>

#include <fcntl.h>
#include <poll.h>
#include <sys/inotify.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include "device/storage/FileDescriptor.h"

namespace appsync::test {

namespace {

constexpr int kLongestWait = 60'000;  // milliseconds

/// Becomes readable at the process's end. By number: the C library declares the call for C alone.
device::FileDescriptor handleOf(pid_t process) {
  return device::FileDescriptor(static_cast<int>(::syscall(SYS_pidfd_open, process, 0)));
}

/// Where the tests are built, and the tool.
std::string binaryFolder() {
  return std::filesystem::canonical("/proc/self/exe").parent_path().string();
}

std::string contentOf(const std::string& path) {
  std::ifstream file(path, std::ios::binary);
  return {std::istreambuf_iterator<char>(file), {}};
}

int openOutput(OutputTo kind, const std::string& path) {
  if (kind == OutputTo::full) return ::open("/dev/full", O_WRONLY | O_CLOEXEC);
  if (kind == OutputTo::file) return ::open(path.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0600);
  int ends[2];
  if (::pipe2(ends, O_CLOEXEC) != 0) return -1;
  ::close(ends[0]);
  return ends[1];
}

/// The environment of this process with `changes`.
std::vector<std::string> environmentWith(const std::map<std::string, std::string>& changes) {
  std::vector<std::string> all;
  for (char** entry = environ; *entry != nullptr; ++entry) {
    const std::string text = *entry;
    if (!changes.contains(text.substr(0, text.find('=')))) all.push_back(text);
  }
  for (const auto& [name, value] : changes)
    all.push_back(name + "=" + value);
  return all;
}

std::vector<char*> pointersTo(std::vector<std::string>& texts) {
  std::vector<char*> pointers;
  for (std::string& text : texts)
    pointers.push_back(text.data());
  pointers.push_back(nullptr);
  return pointers;
}

}  // namespace

ToolRun::ToolRun(const std::vector<std::string>& words, const ToolOptions& options, const std::string& program) {
  std::vector<std::string> arguments = {program};
  arguments.insert(arguments.end(), words.begin(), words.end());
  std::vector<std::string> environment = environmentWith(options.environment);
  const auto argumentPointers = pointersTo(arguments);
  const auto environmentPointers = pointersTo(environment);
  std::ofstream(folder_.path("in"), std::ios::binary) << options.input;
  const int input = ::open(folder_.path("in").c_str(), O_RDONLY | O_CLOEXEC);
  const int output = openOutput(options.output, folder_.path("out"));
  const int error = openOutput(OutputTo::file, folder_.path("err"));
  const std::string path = program == "appsync" ? binaryFolder() + "/appsync" : program;
  process_ = ::fork();
  if (process_ == 0) {
    ::dup2(input, STDIN_FILENO);
    ::dup2(output, STDOUT_FILENO);
    ::dup2(error, STDERR_FILENO);
    ::execvpe(path.c_str(), argumentPointers.data(), environmentPointers.data());
    ::_exit(127);
  }
  for (const int file : {input, output, error})
    ::close(file);
}

ToolRun::~ToolRun() {
  if (process_ < 0) return;
  ::kill(process_, SIGKILL);
  ::waitpid(process_, nullptr, 0);
}

void ToolRun::signal(int number) const {
  ::kill(process_, number);
}

bool ToolRun::ends() const {
  const device::FileDescriptor end = handleOf(process_);
  pollfd waited{end.get(), POLLIN, 0};
  return ::poll(&waited, 1, kLongestWait) == 1;
}

bool ToolRun::writes(std::string_view text) const {
  const std::string path = folder_.path("out");
  const device::FileDescriptor end = handleOf(process_);
  const device::FileDescriptor writing(::inotify_init1(IN_CLOEXEC | IN_NONBLOCK));
  ::inotify_add_watch(writing.get(), path.c_str(), IN_MODIFY);
  pollfd waited[] = {{writing.get(), POLLIN, 0}, {end.get(), POLLIN, 0}};
  for (bool goesOn = true;;) {
    if (contentOf(path).find(text) != std::string::npos) return true;
    if (!goesOn) return false;
    goesOn = ::poll(waited, 2, kLongestWait) > 0 && waited[1].revents == 0;
    char events[4096];
    while (::read(writing.get(), events, sizeof events) > 0) {
    }
  }
}

Finished ToolRun::wait() {
  int status = 0;
  ::waitpid(process_, &status, 0);
  process_ = -1;
  const int result = WIFEXITED(status) ? WEXITSTATUS(status) : -WTERMSIG(status);
  return {result, contentOf(folder_.path("out")), contentOf(folder_.path("err"))};
}

Finished runTool(const std::vector<std::string>& words, const ToolOptions& options) {
  return ToolRun(words, options).wait();
}

Finished runProgram(const std::string& program, const std::vector<std::string>& words, const ToolOptions& options) {
  ToolOptions withTool = options;
  withTool.environment["PATH"] = binaryFolder() + ":" + std::getenv("PATH");
  return ToolRun(words, withTool, program).wait();
}

}  // namespace appsync::test
