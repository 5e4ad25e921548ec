// Files of the host, outside any device.
#pragma once

#include <cstdint>
#include <functional>
#include <string>

#include "base/Bytes.h"
#include "base/Error.h"

namespace appsync::device {

/// The path that means standard input or standard output.
inline constexpr const char* kStandardStream = "-";

/// Default limit of files that are read whole.
inline constexpr std::uint64_t kLargestHostFile = 1'000'000'000;

/// Reads a regular file of at most `most` bytes. Fails for pipes and devices without waiting for them. The errors of
/// all functions of this header are of domain "POSIX" and name the path.
[[nodiscard]] Result<Bytes> readHostFile(const std::string& path, std::uint64_t most = kLargestHostFile);

/// Reads a file, pipe, device or standard input to its end, waiting for the writers of pipes.
[[nodiscard]] Result<Bytes> readHostStream(const std::string& path, std::uint64_t most = kLargestHostFile);

/// Replaces a file atomically: after a failure, crash or power failure it has its old content or `bytes`. Replaces a
/// link, not its target. Keeps the mode of a replaced file.
[[nodiscard]] Status replaceHostFile(const std::string& path, ByteView bytes);

/// Writes all bytes to an open file, pipe or device. Returns 0 or an errno value: EPIPE if a pipe has no reader.
[[nodiscard]] int writeAll(int stream, ByteView bytes);

/// Writes a result to the path that a user named. Replaces files atomically, following links; writes to pipes, devices
/// and, for "-", standard output directly. Succeeds if the reader of a pipe closes it early.
[[nodiscard]] Status writeHostFile(const std::string& path, ByteView bytes);

/// Writes a result to an open, empty file.
using HostFileFill = std::function<Status(int file)>;

/// Writes the output of `fill` to `path`. If `fill` fails, nothing is written.
[[nodiscard]] Status writeHostFile(const std::string& path, const HostFileFill& fill);

/// Removes the incomplete files that crashed writers left in a directory, ignoring failures.
void removeHostFileDrafts(int folder);

}  // namespace appsync::device
