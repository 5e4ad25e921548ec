#include "device/services/LogSink.h"

#include <cerrno>

#include <fcntl.h>

#include "base/TimeText.h"
#include "device/storage/HostFile.h"

namespace appsync::device {

Result<std::unique_ptr<FileLogSink>> FileLogSink::open(const std::string& hostPath) {
  // Opening a pipe would wait for its reader. Once open, writes to it may block as those to a file.
  FileDescriptor file(
      ::open(hostPath.c_str(), O_WRONLY | O_APPEND | O_CREAT | O_NONBLOCK | O_NOCTTY | O_CLOEXEC, 0644));
  if (!file.valid() && errno == ENXIO) {
    return Error{std::string(domains::kPOSIX), ENXIO,
                 "cannot open log file \"" + hostPath + "\": the pipe has no reader; start its reader first", nullptr};
  }
  if (!file.valid() || ::fcntl(file.get(), F_SETFL, O_APPEND) != 0) {
    return Error::fromErrno(errno, "cannot open log file \"" + hostPath + "\"");
  }
  return std::unique_ptr<FileLogSink>(new FileLogSink(std::move(file)));
}

void FileLogSink::write(std::chrono::system_clock::time_point time, int category, LogLevel level,
                        std::string_view message) {
  std::string line;
  line.reserve(message.size() + 48);
  appendTime(line, std::chrono::floor<std::chrono::microseconds>(time));
  line += ' ';
  line += std::to_string(category);
  line += level == LogLevel::error ? " error " : " default ";
  line += message;
  line += '\n';
  static_cast<void>(writeAll(file_.get(), bytesOf(line)));
}

}  // namespace appsync::device
