// The system calls that change a device's files. Each is a fault point.
#pragma once

#include <cstdint>

#include <sys/stat.h>
#include <sys/types.h>

#include "base/Bytes.h"
#include "device/storage/FileDescriptor.h"

/// Names are relative to an open directory. Calls interrupted by a signal are repeated. Each returns 0 or an errno
/// value.
namespace appsync::device::sys {

inline constexpr mode_t kFolderMode = 0755;
inline constexpr mode_t kFileMode = 0644;

[[nodiscard]] int makeFolder(int folder, const char* name);
/// Creates a file and opens it for writing. Fails with EEXIST if a file or link exists.
[[nodiscard]] int createFile(int folder, const char* name, mode_t mode, FileDescriptor& file);
/// Writes all bytes at `offset`.
[[nodiscard]] int writeAt(int file, ByteView bytes, std::int64_t offset);
[[nodiscard]] int makeLink(const char* target, int folder, const char* name);

enum class Replace { no, yes };
/// With `Replace::no`, fails with EEXIST if the new name exists.
[[nodiscard]] int rename(int fromFolder, const char* from, int toFolder, const char* to, Replace replace);

[[nodiscard]] int removeFile(int folder, const char* name);
[[nodiscard]] int removeEmptyFolder(int folder, const char* name);

/// Writes a new file's content to the disk, so that after a power failure a later rename has either not happened or
/// names the complete file. The rename itself is not made durable.
[[nodiscard]] int writeOut(int file);
/// Makes every change of the file system that contains `file` durable.
[[nodiscard]] int syncFileSystem(int file);

/// Sets both times to now.
[[nodiscard]] int touch(int file);
/// Sets a file's permissions, regardless of the umask, and the times of `status`, as far as the file system supports
/// them.
[[nodiscard]] int setAttributes(int file, mode_t mode, const struct stat& status);
/// Appends the rest of one file to another, sharing blocks if the file system supports it, and adds the size to
/// `bytes`.
[[nodiscard]] int copyContents(int from, int to, std::uint64_t& bytes);

}  // namespace appsync::device::sys
