// The device's file system, in memory.
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

/// Begins with "/tmp" alone. Fails the test when the test puts something where nothing can be. Journal lines:
/// "fileSystem.readFile /path", "fileSystem.moveItem /from /to".
class FakeFileSystem : public platform::FileSystem {
 public:
  explicit FakeFileSystem(CallJournal& journal);

  // What is there. None of these is journaled or made to fail; writing makes missing folders.
  void put(std::string_view path, ByteView bytes);
  void put(std::string_view path, std::string_view text) { put(path, bytesOf(text)); }
  void putFolder(std::string_view path);
  void putLink(std::string_view path, std::string_view target);
  void erase(std::string_view path);
  [[nodiscard]] bool has(std::string_view path);
  [[nodiscard]] bool hasFolder(std::string_view path);
  /// The file's contents, links followed; none when there is no such file.
  [[nodiscard]] std::optional<Bytes> contents(std::string_view path);
  [[nodiscard]] std::optional<std::string> text(std::string_view path);
  /// As given when it was made; none when nothing is there.
  [[nodiscard]] std::optional<platform::OwnerAttributes> owners(std::string_view path);
  /// How often it was touched.
  [[nodiscard]] std::size_t touches(std::string_view path);
  /// How often the file was written with success, by that path, since the beginning.
  [[nodiscard]] std::size_t writes(std::string_view path) const;
  /// Every path below `folder`, in order; folders end with a slash.
  [[nodiscard]] std::vector<std::string> paths(std::string_view folder = "/");

  /// Failures by operation and path; copies and moves fail by either of their paths.
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
