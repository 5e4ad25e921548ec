// The device's file system, on a folder of this machine.
#pragma once

#include <string>
#include <string_view>

#include "device/storage/Access.h"
#include "device/storage/Durability.h"
#include "device/storage/RootDirectory.h"
#include "platform/FileSystem.h"

namespace appsync::device {

/// Device path "/var/x" is "var/x" in the root folder. Files that are being written, copied or removed are in the work
/// folder, of the same host file system, until they are whole or gone: a kill leaves nothing half done in the root.
///
/// Account names are the device's, not this machine's: they are kept as extended attributes. Where the host's file
/// system has none they are not kept, and nothing fails for that.
class DeviceFileSystem final : public platform::FileSystem {
 public:
  static constexpr std::string_view kTemporaryDirectory = "/tmp";

  /// `work` is the open work folder. With `Access::readOnly` everything that would write fails with EROFS.
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

  /// The owners that an item was made with.
  [[nodiscard]] Result<platform::OwnerAttributes> ownersOfItem(std::string_view path);

  [[nodiscard]] const RootDirectory& root() const noexcept { return root_; }
  /// The open work folder.
  [[nodiscard]] int work() const noexcept { return work_.get(); }

 private:
  /// The place of something that is about to change.
  [[nodiscard]] Result<RootDirectory::Place> placeToChange(std::string_view path) const;
  [[nodiscard]] Status writeNew(std::string_view path, ByteView bytes, const platform::OwnerAttributes& attributes,
                                Durability durability);

  RootDirectory root_;
  FileDescriptor work_;
  Access access_;
};

}  // namespace appsync::device
