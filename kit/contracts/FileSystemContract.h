// Contract of platform/FileSystem.h.
#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "kit/contracts/Contract.h"
#include "platform/FileSystem.h"

namespace appsync::test {

class FileSystemSubject {
 public:
  virtual ~FileSystemSubject() = default;

  [[nodiscard]] virtual platform::FileSystem& fileSystem() = 0;

  /// Device path of an existing, empty directory, without a trailing slash.
  [[nodiscard]] virtual std::string folder() = 0;

  // Optional: the default implementations skip the tests that need them.

  /// Creates a symbolic link. Returns false if not supported.
  [[nodiscard]] virtual bool makeLink(std::string_view path, std::string_view target) {
    static_cast<void>(path), static_cast<void>(target);
    return false;
  }
  /// Returns the owners that the item was created with, or nullopt if not supported.
  [[nodiscard]] virtual std::optional<platform::OwnerAttributes> ownersOf(std::string_view path) {
    static_cast<void>(path);
    return std::nullopt;
  }
  /// Sets the item's times to the distant past. Returns false if not supported.
  [[nodiscard]] virtual bool makeOld(std::string_view path) {
    static_cast<void>(path);
    return false;
  }
  [[nodiscard]] virtual bool isOld(std::string_view path) {
    static_cast<void>(path);
    return false;
  }
};

class FileSystemContract : public Contract<FileSystemSubject> {
 protected:
  [[nodiscard]] platform::FileSystem& files() { return subject().fileSystem(); }
  /// A path in the test's directory.
  [[nodiscard]] std::string at(std::string_view name) { return subject().folder().append("/").append(name); }
  void write(std::string_view name, std::string_view text);
  void makeFolder(std::string_view name);
  /// Returns the file's text, or "(none)" if it cannot be read.
  [[nodiscard]] std::string read(std::string_view name);
  [[nodiscard]] bool exists(std::string_view name) { return files().fileExists(at(name)); }
};

}  // namespace appsync::test
