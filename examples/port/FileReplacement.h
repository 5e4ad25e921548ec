// Atomic replacement of files.
#pragma once

#include <string>
#include <string_view>

namespace port {

/// Creates or replaces the file at `path`. Atomic for readers and across power failures. Returns 0, or the system's
/// error number; the file is then unchanged. If the file system cannot sync directories, a power failure may restore
/// the old file.
[[nodiscard]] int replaceFile(const std::string& path, std::string_view text);

}  // namespace port
