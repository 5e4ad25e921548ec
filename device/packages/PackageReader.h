// Reads untrusted packages entry by entry.
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

/// The maximum size of packages.
struct PackageLimits {
  std::uint64_t entries = 100'000;
  std::uint64_t unpackedBytes = std::uint64_t{8} << 30;
  /// Maximum compression ratio, not checked up to `freeBytes` of unpacked content.
  std::uint64_t ratio = 200;
  std::uint64_t freeBytes = std::uint64_t{64} << 20;
};

/// A package is a zip archive of one folder "Name.app" and, next to it, at most the files `kStoreMetadataName` and
/// `kArtworkName`. Names are relative, in UTF-8, without "." and ".." components; entries are files and folders, each
/// once; nothing is encrypted.
///
/// Errors: platform::kInstallerErrorDomain, with a text that names the entry and a remedy, or "POSIX". Not thread-safe,
/// but several readers may be used at once.
class PackageReader {
 public:
  enum class Kind : std::uint8_t { file, folder };

  struct Entry {
    std::string path;  ///< without a slash at its end
    Kind kind = Kind::file;
    bool executable = false;
  };

  /// Opens a package. `file` must be seekable and positioned at its start.
  [[nodiscard]] static Result<PackageReader> open(FileDescriptor file, PackageLimits limits = {});

  /// Skips the rest of the current entry and moves to the next. Returns false at the end.
  [[nodiscard]] Result<bool> next(Entry& entry);

  /// A part of the current entry's content, which starts at `offset`.
  struct Block {
    ByteView bytes;  ///< valid until the next call of the reader
    std::int64_t offset = 0;
  };
  /// Returns false at the end of the entry, after its length and checksum were verified.
  [[nodiscard]] Result<bool> nextBlock(Block& block);

  /// Reads the rest of the current entry. Fails if it has more than `most` bytes.
  [[nodiscard]] Result<Bytes> readAll(std::uint64_t most);

  /// The name of the app folder, empty until one of its entries was read.
  [[nodiscard]] const std::string& appFolder() const noexcept { return appFolder_; }
  /// Returns the fraction of the package that was read, from 0 to 1.
  [[nodiscard]] double fraction() const;
  /// The size of the package file.
  [[nodiscard]] std::uint64_t packageBytes() const noexcept { return packageBytes_; }
  /// The number of bytes unpacked so far.
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
