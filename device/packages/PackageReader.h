// Reads a package entry by entry, and trusts nothing in it.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>
#include <unordered_set>

#include "base/Bytes.h"
#include "base/Error.h"
#include "device/storage/FileDescriptor.h"

struct archive;

namespace appsync::device {

/// What a package may not exceed.
struct PackageLimits {
  std::uint64_t entries = 100'000;
  std::uint64_t unpackedBytes = std::uint64_t{8} << 30;
  /// Unpacked bytes for each byte of the package. Counts only above `freeBytes`: small files may pack as tightly as
  /// they like.
  std::uint64_t ratio = 200;
  std::uint64_t freeBytes = std::uint64_t{64} << 20;
};

/// A package is a zip archive that holds one folder "Name.app" and, beside it, at most the files `kStoreMetadataName`
/// and `kArtworkName`. Names are relative, in UTF-8, with plain components; entries are files and folders, each once;
/// nothing is encrypted.
///
/// Errors: platform::kInstallerErrorDomain, each saying which entry and what to do; "POSIX" where the system failed.
/// Threads: one at a time; any number of readers side by side.
class PackageReader {
 public:
  enum class Kind : std::uint8_t { file, folder };

  struct Entry {
    std::string path;  ///< without a slash at its end
    Kind kind = Kind::file;
    bool executable = false;
  };

  /// Opens a package. `size` is the file's; `file` must be at its start and seekable.
  [[nodiscard]] static Result<PackageReader> open(FileDescriptor file, PackageLimits limits = {});

  /// Moves to the next entry and passes over what is left of the current one; false at the end.
  [[nodiscard]] Result<bool> next(Entry& entry);

  /// A piece of the current entry's bytes, to be stored at `offset`.
  struct Block {
    ByteView bytes;  ///< the reader's, until its next call
    std::int64_t offset = 0;
  };
  /// False at the entry's end, when its length and checksum have turned out right.
  [[nodiscard]] Result<bool> nextBlock(Block& block);

  /// The rest of the current entry, which may not have more than `most` bytes.
  [[nodiscard]] Result<Bytes> readAll(std::uint64_t most);

  /// The name of the app folder, once an entry of it was seen.
  [[nodiscard]] const std::string& appFolder() const noexcept { return appFolder_; }
  /// How far into the package reading is, from 0 to 1.
  [[nodiscard]] double fraction() const;
  /// The package file's own size.
  [[nodiscard]] std::uint64_t packageBytes() const noexcept { return packageBytes_; }
  /// All bytes unpacked so far.
  [[nodiscard]] std::uint64_t unpackedBytes() const noexcept { return unpackedBytes_; }

 private:
  struct Closer {
    void operator()(archive* reader) const noexcept;
  };

  PackageReader() = default;

  [[nodiscard]] Status check(const Entry& entry);
  [[nodiscard]] Status checkPlace(std::string_view path, Kind kind);
  [[nodiscard]] Error failure() const;
  [[nodiscard]] Error tooLarge() const;

  FileDescriptor file_;
  std::unique_ptr<archive, Closer> reader_;
  PackageLimits limits_;
  std::uint64_t packageBytes_ = 0;
  std::uint64_t unpackedBytes_ = 0;
  std::uint64_t entries_ = 0;
  std::string appFolder_;
  std::string current_;
  std::unordered_set<std::string> seen_;
};

}  // namespace appsync::device
