// A device path together with its kind.
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace appsync::platform {

/// A device path and whether it denotes a directory. Nothing needs to exist at the path.
struct FileLocation {
  std::string path;
  bool isDirectory = false;

  /// Return nullopt if `path` is empty or contains a NUL byte.
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
