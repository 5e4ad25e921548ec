// A folder of this machine that is whole or not there.
#pragma once

#include <filesystem>
#include <string>

#include "base/Error.h"
#include "device/storage/FileDescriptor.h"

namespace appsync::host {

/// A folder that is being filled beside its place, in a hidden folder that says what it is. Unless it is published its
/// end removes it; after a kill the next draft for the same place does.
class FolderDraft {
 public:
  /// Fails when there is something at `path`, when its parent is not there, while another process fills a draft for it,
  /// and when something that is no draft has the hidden folder's name, which is left as it is. Errors: "POSIX"; the
  /// text says what to do.
  [[nodiscard]] static Result<FolderDraft> make(const std::string& path);
  FolderDraft(FolderDraft&&) = default;
  FolderDraft& operator=(FolderDraft&&) = delete;
  ~FolderDraft();

  /// The open folder.
  [[nodiscard]] int folder() const noexcept { return folder_.get(); }

  /// The path of the open folder until it is published.
  [[nodiscard]] std::string folderPath() const;

  /// Brings it to the disk and gives it its name.
  [[nodiscard]] Status publish();

 private:
  FolderDraft(std::string path, const std::filesystem::path& place, device::FileDescriptor parent);
  [[nodiscard]] Status takeHold();
  /// Opens and locks the hidden folder, made if it is missing; false when it has gone or another one has taken its
  /// place.
  [[nodiscard]] Result<bool> lockShell();

  std::string path_;
  std::string name_;
  std::string shellName_;
  std::string shellPath_;
  device::FileDescriptor parent_;
  /// The hidden folder, which is locked, and in it the one that is published.
  device::FileDescriptor shell_;
  device::FileDescriptor folder_;
};

}  // namespace appsync::host
