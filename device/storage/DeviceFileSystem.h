// The device's file system, stored in a directory of the host.
#pragma once

#include <string>
#include <string_view>

#include "device/storage/Access.h"
#include "device/storage/Durability.h"
#include "device/storage/RootDirectory.h"
#include "platform/FileSystem.h"

namespace appsync::device {

/// Device path "/var/x" is "var/x" in the root directory. Files are written, copied and removed in the work directory,
/// on the same host file system, so that all changes of the root are atomic. Thread-safe.
///
/// Account names belong to the device, not to the host, and are stored as extended attributes. If the host's file
/// system has none, they are silently dropped.
class DeviceFileSystem final : public platform::FileSystem {
 public:
  static constexpr std::string_view kTemporaryDirectory = "/tmp";

  /// `work` is the open work directory. With `Access::readOnly` every change fails with EROFS.
  DeviceFileSystem(RootDirectory root, FileDescriptor work, Access access)
      : root_(std::move(root)), work_(std::move(work)), access_(access) {}

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
  [[nodiscard]] std::string temporaryDirectory() override { return std::string(kTemporaryDirectory); }

  /// Returns the owners with which an item was created; nullopt fields if they were not stored.
  [[nodiscard]] Result<platform::OwnerAttributes> ownersOfItem(std::string_view path);

  [[nodiscard]] const RootDirectory& root() const noexcept { return root_; }
  /// The open work directory.
  [[nodiscard]] int work() const noexcept { return work_.get(); }

 private:
  /// Resolves the path of an item to change. Fails with EROFS on a read-only device.
  [[nodiscard]] Result<RootDirectory::Place> placeToChange(std::string_view path) const;
  [[nodiscard]] Status writeNew(std::string_view path, ByteView bytes, const platform::OwnerAttributes& attributes,
                                Durability durability);

  RootDirectory root_;
  FileDescriptor work_;
  Access access_;
};

}  // namespace appsync::device
