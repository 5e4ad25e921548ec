// An in-memory tree of directories, files and links.
#pragma once

#include <cstddef>
#include <map>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "base/Bytes.h"
#include "base/Error.h"
#include "platform/FileSystem.h"

namespace appsync::test {

enum class FileKind { file, folder, link };

struct FileNode {
  FileKind kind = FileKind::file;
  Bytes bytes;
  std::string target;  ///< of a link
  platform::OwnerAttributes owners;
  std::size_t touches = 0;
  std::map<std::string, std::unique_ptr<FileNode>, std::less<>> children;

  [[nodiscard]] std::unique_ptr<FileNode> clone() const;
};

/// Whether a link at the end of a path is followed.
enum class LastLink { itself, followed };

/// Paths are absolute. Resolves ".", ".." and links as POSIX does; leaving the root is an error. Errors: domain
/// "POSIX"; the text names the path. Not thread-safe.
class FakeFileTree {
 public:
  /// The result of resolving a path. `node` is null if nothing exists there; `parent` is null for the root.
  struct Place {
    FileNode* parent = nullptr;
    std::string name;
    FileNode* node = nullptr;
  };

  FakeFileTree();

  /// Resolves a path. Fails if the path is invalid or a parent is missing.
  [[nodiscard]] Result<Place> find(std::string_view path, LastLink lastLink);

  /// Like `find`; also fails with ENOENT if nothing exists there.
  [[nodiscard]] Result<Place> findExisting(std::string_view path, LastLink lastLink);

  /// Like `find`; also fails with EEXIST if an item exists there.
  [[nodiscard]] Result<Place> findFree(std::string_view path);

  /// Creates a directory and its missing parents, all with these owners. Succeeds if it exists.
  [[nodiscard]] Status makeFolders(std::string_view path, const platform::OwnerAttributes& owners);

  /// Puts `node` at `place`, which must have a parent, and replaces an existing node.
  static FileNode& put(const Place& place, std::unique_ptr<FileNode> node);

  /// Returns every path below `folder`, in order; directories end with a slash.
  [[nodiscard]] std::vector<std::string> paths(std::string_view folder);

 private:
  FileNode root_;
};

[[nodiscard]] std::unique_ptr<FileNode> makeFile(ByteView bytes, const platform::OwnerAttributes& owners);
[[nodiscard]] std::unique_ptr<FileNode> makeFolder(const platform::OwnerAttributes& owners);
[[nodiscard]] std::unique_ptr<FileNode> makeLink(std::string_view target);

}  // namespace appsync::test
