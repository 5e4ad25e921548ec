// A folder of this machine that is whole or not there.
#pragma once

#include <string>

#include "base/Error.h"
#include "device/FileDescriptor.h"

namespace appsync::tools {

/// A folder that is being filled beside its place, under a hidden name. Unless it is published its end removes it;
/// after a kill the next draft for the same place does.
class FolderDraft {
 public:
  /// Fails when there is something at `path`, when its parent is not there, and while another process fills a draft for
  /// it. Errors: "POSIX"; the text says what to do.
  [[nodiscard]] static Result<FolderDraft> make(const std::string& path);
  FolderDraft(FolderDraft&&) = default;
  FolderDraft& operator=(FolderDraft&&) = delete;
  ~FolderDraft();

  /// The open folder.
  [[nodiscard]] int folder() const noexcept { return folder_.get(); }

  /// Brings it to the disk and gives it its name.
  [[nodiscard]] Status publish();

 private:
  FolderDraft(std::string path, std::string name, device::FileDescriptor parent);
  [[nodiscard]] Status takeHold();

  std::string path_;
  std::string name_;
  std::string draftName_;
  device::FileDescriptor parent_;
  device::FileDescriptor folder_;
};

}  // namespace appsync::tools
