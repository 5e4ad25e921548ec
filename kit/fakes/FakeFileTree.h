// A file system's folders, files and links in memory.
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

/// Whether a link at a path's end stands for itself or for what it leads to.
enum class LastLink { itself, followed };

/// Paths are absolute; "." and ".." and links are understood as the system does, and leaving the root is an error.
/// Errors: domain "POSIX", the text names the path. Not safe for use by several threads at once.
class FakeFileTree {
 public:
  /// Where a path leads. `node` is null when nothing is there; `parent` is null for the root.
  struct Place {
    FileNode* parent = nullptr;
    std::string name;
    FileNode* node = nullptr;
  };

  FakeFileTree();

  /// Fails when the path cannot be, or a folder on the way is missing.
  [[nodiscard]] Result<Place> find(std::string_view path, LastLink lastLink);

  /// The same, but fails with ENOENT when nothing is there.
  [[nodiscard]] Result<Place> findExisting(std::string_view path, LastLink lastLink);

  /// The same, but fails with EEXIST when something is there.
  [[nodiscard]] Result<Place> findFree(std::string_view path);

  /// Makes a folder, and the missing ones that lead to it, all with these owners. One that exists is a success.
  [[nodiscard]] Status makeFolders(std::string_view path, const platform::OwnerAttributes& owners);

  /// Puts a node at a place that has a parent, in place of what is there.
  static FileNode& put(const Place& place, std::unique_ptr<FileNode> node);

  /// Every path below `folder`, in order; folders end with a slash.
  [[nodiscard]] std::vector<std::string> paths(std::string_view folder);

 private:
  FileNode root_;
};

[[nodiscard]] std::unique_ptr<FileNode> makeFile(ByteView bytes, const platform::OwnerAttributes& owners);
[[nodiscard]] std::unique_ptr<FileNode> makeFolder(const platform::OwnerAttributes& owners);
[[nodiscard]] std::unique_ptr<FileNode> makeLink(std::string_view target);

}  // namespace appsync::test
