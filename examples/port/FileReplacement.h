// Files that a reader, or a device that lost power, finds old or new and never half.
#pragma once

#include <string>
#include <string_view>

namespace port {

/// Replaces the file at `path`, or makes it. Returns 0, or the system's error number, and then nothing has changed. The
/// file that power is lost after may be the old one: where the folder cannot be written through, that is not told.
[[nodiscard]] int replaceFile(const std::string& path, std::string_view text);

}  // namespace port
