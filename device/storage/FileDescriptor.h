// An open file that closes itself.
#pragma once

#include <utility>

#include <unistd.h>

namespace appsync::device {

/// Owns a file descriptor, or none (-1).
class FileDescriptor {
 public:
  FileDescriptor() = default;
  explicit FileDescriptor(int number) noexcept : number_(number) {}
  FileDescriptor(FileDescriptor&& other) noexcept : number_(std::exchange(other.number_, -1)) {}
  FileDescriptor& operator=(FileDescriptor&& other) noexcept {
    std::swap(number_, other.number_);
    return *this;
  }
  ~FileDescriptor() {
    if (number_ >= 0) close(number_);
  }

  [[nodiscard]] int get() const noexcept { return number_; }
  [[nodiscard]] bool valid() const noexcept { return number_ >= 0; }
  [[nodiscard]] int release() noexcept { return std::exchange(number_, -1); }

 private:
  int number_ = -1;
};

}  // namespace appsync::device
