// Whole folders: copied, removed, written.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

#include <dirent.h>

#include "base/Bytes.h"
#include "base/Error.h"

namespace appsync::device {

/// The names in an open folder, but for "." and "..", in the disk's order.
class FolderEntries {
 public:
  /// `folder` stays the caller's.
  explicit FolderEntries(int folder);

  /// The next name, or null at the end. Holds until the next call.
  [[nodiscard]] const char* next();
  /// 0, or the error number that ended the walk early.
  [[nodiscard]] int failure() const noexcept { return failure_; }

 private:
  struct Closer {
    void operator()(DIR* stream) const noexcept { closedir(stream); }
  };
  std::unique_ptr<DIR, Closer> stream_;
  int failure_ = 0;
};

/// Files, folders and links, relative to open folders, which stay the caller's. Each returns 0, or the error number.
namespace tree {

/// Makes `to` a copy of `from`, a file, a link or a folder with all in it, and adds the files' sizes to `bytes`.
/// Permissions and times are kept, but for links, and every folder of the copy may be used by its owner. Anything else
/// than these fails with EINVAL, or is left out and counted where there is a `leftOut`. Fails with EEXIST when `to` is
/// there. A failure leaves part of it.
[[nodiscard]] int copy(int fromFolder, const char* from, int toFolder, const char* to, std::uint64_t& bytes,
                       std::uint64_t* leftOut = nullptr);

/// Makes a file with these bytes in it; a failure leaves none.
[[nodiscard]] int create(int folder, const char* name, ByteView bytes);

/// Removes `name`, whatever it is. It is moved into the `work` folder first, which must be of the same file system: at
/// any moment it is whole or gone from where it was, and `work` holds what remains.
[[nodiscard]] int remove(int folder, const char* name, int work);

/// Removes everything that is in a folder, likewise. The folder may be `work` itself.
[[nodiscard]] int empty(int folder, int work);

/// All that is left of a file, up to `most` bytes; EFBIG beyond them, EISDIR for a folder.
[[nodiscard]] int read(int file, std::uint64_t most, Bytes& bytes);

}  // namespace tree

}  // namespace appsync::device
