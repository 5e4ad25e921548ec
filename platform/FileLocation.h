// Where a file or folder is, as services want to be told.
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace appsync::platform {

/// A device path that services accept, together with whether a folder is meant.
struct FileLocation {
  std::string path;
  bool isDirectory = false;

  /// None when no file can have that path: it is empty or holds a NUL byte.
  [[nodiscard]] static std::optional<FileLocation> file(std::string_view path) { return make(path, false); }
  [[nodiscard]] static std::optional<FileLocation> directory(std::string_view path) { return make(path, true); }

  bool operator==(const FileLocation&) const = default;

 private:
  static std::optional<FileLocation> make(std::string_view path, bool isDirectory) {
    if (path.empty() || path.find('\0') != std::string_view::npos) return std::nullopt;
    return FileLocation{std::string(path), isDirectory};
  }
};

inline void appendDescription(std::string& out, const FileLocation& location) {
  out += location.path;
}

}  // namespace appsync::platform
