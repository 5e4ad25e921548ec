// Where the sync framework's log goes.
#pragma once

#include <chrono>
#include <memory>
#include <string>
#include <string_view>
#include <utility>

#include "base/Error.h"
#include "base/Log.h"
#include "device/storage/FileDescriptor.h"

namespace appsync::device {

/// Threads: any.
class LogSink {
 public:
  virtual ~LogSink() = default;

  /// Takes one message, which is one line of printable text. Nothing fails towards the caller: a message that cannot be
  /// written is lost.
  virtual void write(std::chrono::system_clock::time_point time, int category, LogLevel level,
                     std::string_view message) = 0;
};

/// Appends lines "time, category, level, message", parted by blanks, to a file:
///
///     2026-02-03T04:05:06.789012Z 8 default com.corvel.qor.Zephtra.AppSync|getting installed assets
///
/// Times are UTC, levels "default" and "error". Messages are written as they are: each is one line already, see
/// base/Log.h. Each line is one write at the file's end: lines never mix, not even with those of another process.
class FileLogSink final : public LogSink {
 public:
  /// Opens the file for appending, or makes it. `hostPath` is a path of this machine. A pipe needs a reader already.
  [[nodiscard]] static Result<std::unique_ptr<FileLogSink>> open(const std::string& hostPath);

  void write(std::chrono::system_clock::time_point time, int category, LogLevel level,
             std::string_view message) override;

 private:
  explicit FileLogSink(FileDescriptor file) : file_(std::move(file)) {}

  const FileDescriptor file_;
};

}  // namespace appsync::device
