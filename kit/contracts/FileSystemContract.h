// Holds file systems to platform/FileSystem.h.
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

  /// Device path of a folder that exists and is empty, without a slash at its end.
  [[nodiscard]] virtual std::string folder() = 0;

  // What a file system cannot do or tell is not tested.

  /// Makes a symbolic link; false where there are none.
  [[nodiscard]] virtual bool makeLink(std::string_view path, std::string_view target) {
    static_cast<void>(path), static_cast<void>(target);
    return false;
  }
  /// The owners that the item was made with; none where they cannot be told.
  [[nodiscard]] virtual std::optional<platform::OwnerAttributes> ownersOf(std::string_view path) {
    static_cast<void>(path);
    return std::nullopt;
  }
  /// Sets the item's times long into the past; false where that cannot be done.
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
  /// A path in the test's folder.
  [[nodiscard]] std::string at(std::string_view name) { return subject().folder().append("/").append(name); }
  void write(std::string_view name, std::string_view text);
  void makeFolder(std::string_view name);
  /// The file's text; "(none)" when it cannot be read.
  [[nodiscard]] std::string read(std::string_view name);
  [[nodiscard]] bool exists(std::string_view name) { return files().fileExists(at(name)); }
};

}  // namespace appsync::test
