// Operations on directory trees.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

#include <dirent.h>

#include "base/Bytes.h"
#include "base/Error.h"

namespace appsync::device {

/// Iterates over the names in an open directory, except "." and "..", in the file system's order.
class FolderEntries {
 public:
  /// Does not take ownership of `folder`.
  explicit FolderEntries(int folder);

  /// Returns the next name, valid until the next call, or null at the end and on failure.
  [[nodiscard]] const char* next();
  /// Returns the errno value of the failure that ended the iteration, or 0.
  [[nodiscard]] int failure() const noexcept { return failure_; }

 private:
  struct Closer {
    void operator()(DIR* stream) const noexcept { closedir(stream); }
  };
  std::unique_ptr<DIR, Closer> stream_;
  int failure_ = 0;
};

/// Paths are relative to open directories, which the caller owns. Each function returns 0 or an errno value.
namespace tree {

/// Copies a file, link or directory tree and adds the files' sizes to `bytes`. Copies permissions and times, except
/// those of links, and gives the owner full access to every copied directory. Special files fail with EINVAL or, if
/// `leftOut` is not null, are skipped and counted there. Fails with EEXIST if `to` exists. A failure leaves an
/// incomplete copy.
[[nodiscard]] int copy(int fromFolder, const char* from, int toFolder, const char* to, std::uint64_t& bytes,
                       std::uint64_t* leftOut = nullptr);

/// Creates a file with the given content. A failure leaves no file.
[[nodiscard]] int create(int folder, const char* name, ByteView bytes);

/// Removes a file, link or directory tree atomically: moves it into the directory `work`, which must be on the same
/// file system, and deletes it there. An interrupted or failed removal leaves the rest in `work`.
[[nodiscard]] int remove(int folder, const char* name, int work);

/// Removes every entry of a directory as `remove` does. The directory may be `work`.
[[nodiscard]] int empty(int folder, int work);

/// Reads a regular file to its end. Returns EFBIG if it has more than `most` bytes, EISDIR for a directory and EINVAL
/// for special files.
[[nodiscard]] int read(int file, std::uint64_t most, Bytes& bytes);

}  // namespace tree

}  // namespace appsync::device
