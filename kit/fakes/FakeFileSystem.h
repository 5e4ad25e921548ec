// An in-memory file system.
#pragma once

#include <cstddef>
#include <functional>
#include <map>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "kit/fakes/CallJournal.h"
#include "kit/fakes/FailurePlan.h"
#include "kit/fakes/FakeFileTree.h"
#include "platform/FileSystem.h"

namespace appsync::test {

enum class FileOperation {
  fileExists,
  attributesOfItem,
  readFile,
  writeFileAtomically,
  createFile,
  createDirectory,
  copyItem,
  moveItem,
  removeItem,
  touch
};

/// Initially contains only "/tmp". Fails the test if the test puts an item at an impossible path. Journal lines:
/// "fileSystem.readFile /path", "fileSystem.moveItem /from /to".
class FakeFileSystem : public platform::FileSystem {
 public:
  explicit FakeFileSystem(CallJournal& journal);

  // Contents. These are not journaled and ignore planned failures; missing parents are created.
  void put(std::string_view path, ByteView bytes);
  void put(std::string_view path, std::string_view text) { put(path, bytesOf(text)); }
  void putFolder(std::string_view path);
  void putLink(std::string_view path, std::string_view target);
  void erase(std::string_view path);
  [[nodiscard]] bool has(std::string_view path);
  [[nodiscard]] bool hasFolder(std::string_view path);
  /// Returns the file's contents, or nullopt if it does not exist. Follows links.
  [[nodiscard]] std::optional<Bytes> contents(std::string_view path);
  [[nodiscard]] std::optional<std::string> text(std::string_view path);
  /// Returns the owners given at creation, or nullopt if the item does not exist.
  [[nodiscard]] std::optional<platform::OwnerAttributes> owners(std::string_view path);
  /// Returns how many times the item was touched.
  [[nodiscard]] std::size_t touches(std::string_view path);
  /// Returns how many times the file was written successfully under this path.
  [[nodiscard]] std::size_t writes(std::string_view path) const;
  /// Returns every path below `folder`, in order; directories end with a slash.
  [[nodiscard]] std::vector<std::string> paths(std::string_view folder = "/");

  /// Failures by operation and path. Either path of a copy or move matches.
  FailurePlan<FileOperation> failures;

  [[nodiscard]] bool fileExists(std::string_view path) override;
  [[nodiscard]] Result<platform::FileAttributes> attributesOfItem(std::string_view path) override;
  [[nodiscard]] Result<Bytes> readFile(std::string_view path) override;
  [[nodiscard]] Status writeFileAtomically(std::string_view path, ByteView bytes) override;
  [[nodiscard]] Status createFile(std::string_view path, ByteView bytes,
                                  const platform::OwnerAttributes& attributes) override;
  [[nodiscard]] Status createDirectory(std::string_view path, platform::IntermediateDirectories intermediates,
                                       const platform::OwnerAttributes& attributes) override;
  [[nodiscard]] Status copyItem(std::string_view from, std::string_view to) override;
  [[nodiscard]] Status moveItem(std::string_view from, std::string_view to) override;
  [[nodiscard]] Status removeItem(std::string_view path) override;
  [[nodiscard]] Status touch(std::string_view path) override;
  [[nodiscard]] std::string temporaryDirectory() override;

 private:
  std::optional<Error> begin(FileOperation operation, std::string_view path, std::string_view otherPath = {});
  Status replaceFile(std::string_view path, ByteView bytes, const platform::OwnerAttributes& owners);

  CallJournal& journal_;
  mutable std::mutex mutex_;
  FakeFileTree tree_;
  std::map<std::string, std::size_t, std::less<>> writes_;
};

}  // namespace appsync::test
