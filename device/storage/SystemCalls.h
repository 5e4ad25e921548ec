// The system calls that change a device's files. Each is one step that a test may stop or fail.
#pragma once

#include <cstdint>

#include <sys/stat.h>
#include <sys/types.h>

#include "base/Bytes.h"
#include "device/storage/FileDescriptor.h"

/// Names are relative to an open folder; calls cut short by a signal are made again. Each returns 0, or the error
/// number.
namespace appsync::device::sys {

inline constexpr mode_t kFolderMode = 0755;
inline constexpr mode_t kFileMode = 0644;

[[nodiscard]] int makeFolder(int folder, const char* name);
/// Makes a file and opens it for writing; one that exists already, a link included, is a failure.
[[nodiscard]] int createFile(int folder, const char* name, mode_t mode, FileDescriptor& file);
/// Writes all of it at `offset`.
[[nodiscard]] int writeAt(int file, ByteView bytes, std::int64_t offset);
[[nodiscard]] int makeLink(const char* target, int folder, const char* name);

enum class Replace { no, yes };
/// Without replacing, anything at the new place is EEXIST.
[[nodiscard]] int rename(int fromFolder, const char* from, int toFolder, const char* to, Replace replace);

[[nodiscard]] int removeFile(int folder, const char* name);
[[nodiscard]] int removeEmptyFolder(int folder, const char* name);

/// Writes a new file's bytes out, so that no later rename of it reaches the disk before them. Does not wait for the
/// rename's own safety: a loss of power finds the old file or the new one.
[[nodiscard]] int writeOut(int file);
/// Brings everything in the file system that `file` lies in to the disk.
[[nodiscard]] int syncFileSystem(int file);

/// Sets both times to now.
[[nodiscard]] int touch(int file);
/// Gives a file of one's own these permissions, whatever the process's mask, and the times of `status`, as far as its
/// file system can keep them.
[[nodiscard]] int setAttributes(int file, mode_t mode, const struct stat& status);
/// Copies what is left of one file to the end of another, sharing blocks where the file system can; adds to `bytes`.
[[nodiscard]] int copyContents(int from, int to, std::uint64_t& bytes);

}  // namespace appsync::device::sys
