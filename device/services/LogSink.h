// Destinations of the sync framework's log.
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

/// Thread-safe.
class LogSink {
 public:
  virtual ~LogSink() = default;

  /// Writes one message, which is one line of printable text. Messages that cannot be written are dropped.
  virtual void write(std::chrono::system_clock::time_point time, int category, LogLevel level,
                     std::string_view message) = 0;
};

/// Appends lines "time category level message" to a file:
///
///     2026-02-03T04:05:06.789012Z 8 default com.corvel.qor.Zephtra.AppSync|getting installed assets
///
/// Times are UTC, levels "default" and "error". Messages are written unchanged: each is one line already, see
/// base/Log.h. Each line is one atomic
/// append: lines never interleave, even those of several processes.
class FileLogSink final : public LogSink {
 public:
  /// Opens or creates the file for appending. Fails for a pipe without a reader.
  [[nodiscard]] static Result<std::unique_ptr<FileLogSink>> open(const std::string& hostPath);

  void write(std::chrono::system_clock::time_point time, int category, LogLevel level,
             std::string_view message) override;

 private:
  explicit FileLogSink(FileDescriptor file) : file_(std::move(file)) {}

  const FileDescriptor file_;
};

}  // namespace appsync::device
