// Random names that are unique across processes.
#pragma once

#include <cstddef>
#include <string>

namespace appsync::device {

/// Returns a random UUID, version 4, in capitals. Thread-safe.
[[nodiscard]] std::string newUUID();

inline constexpr std::size_t kTemporaryNameDigits = 16;
/// Returns a random hexadecimal name for a temporary file, unique across processes, including other PID namespaces.
/// Thread-safe.
[[nodiscard]] std::string temporaryName();

}  // namespace appsync::device
