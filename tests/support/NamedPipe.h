// Named pipes.
#pragma once

#include <string>

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include "device/storage/FileDescriptor.h"

namespace appsync::test {

/// A pipe without a writer.
inline void makePipe(const std::string& path) {
  ASSERT_EQ(::mkfifo(path.c_str(), 0600), 0) << path;
}

/// A pipe with a non-blocking reader and a capacity of 1 MB.
class NamedPipe {
 public:
  explicit NamedPipe(std::string path) : path_(std::move(path)) {
    makePipe(path_);
    reader_ = device::FileDescriptor(::open(path_.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC));
    EXPECT_GE(::fcntl(reader_.get(), F_SETPIPE_SZ, kSize), kSize);
  }

  /// Returns whether the path is still a pipe.
  [[nodiscard]] bool isThere() const {
    struct stat found = {};
    return ::lstat(path_.c_str(), &found) == 0 && S_ISFIFO(found.st_mode);
  }
  /// Returns the bytes that were written and not read yet.
  [[nodiscard]] std::string contents() const {
    std::string all(kSize, '\0');
    const ssize_t count = ::read(reader_.get(), all.data(), all.size());
    all.resize(count < 0 ? 0 : static_cast<std::size_t>(count));
    return all;
  }

 private:
  static constexpr int kSize = 1 << 20;

  const std::string path_;
  device::FileDescriptor reader_;
};

}  // namespace appsync::test
