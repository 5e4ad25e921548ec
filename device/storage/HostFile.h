// Files of this machine, outside any device.
#pragma once

#include <cstdint>
#include <functional>
#include <string>

#include "base/Bytes.h"
#include "base/Error.h"

namespace appsync::device {

/// The name that stands for standard input, or standard output.
inline constexpr const char* kStandardStream = "-";

/// More bytes than any file has that is read whole.
inline constexpr std::uint64_t kLargestHostFile = 1'000'000'000;

/// The whole of a file of at most `most` bytes. What is no file, such as a pipe, is refused and never waited for.
/// Errors, of all that stands here: "POSIX", the text names the path.
[[nodiscard]] Result<Bytes> readHostFile(const std::string& path, std::uint64_t most = kLargestHostFile);

/// The same of whatever can be read to its end, and of standard input: waits for who writes into a pipe.
[[nodiscard]] Result<Bytes> readHostStream(const std::string& path, std::uint64_t most = kLargestHostFile);

/// Makes the file at a host path hold `bytes`, in one step: after a failure, a kill or a loss of power it holds what it
/// held, or all of `bytes`. A link is replaced itself. A file that is replaced leaves its mode to the new one.
[[nodiscard]] Status replaceHostFile(const std::string& path, ByteView bytes);

/// Writes all of it to an open file, pipe or device. 0, or the error number: EPIPE when nobody reads any more.
[[nodiscard]] int writeAll(int stream, ByteView bytes);

/// Writes what people name as the place of a result: a file is replaced like that, behind links the file that they lead
/// to; a pipe or device is written to as it is, "-" is standard output. A reader that leaves early is no failure.
[[nodiscard]] Status writeHostFile(const std::string& path, ByteView bytes);

/// Writes all of a result to an open file, which is empty.
using HostFileFill = std::function<Status(int file)>;

/// The same with what `fill` writes, of which nothing reaches the place when it fails.
[[nodiscard]] Status writeHostFile(const std::string& path, const HostFileFill& fill);

/// Removes from a folder the unfinished files of writers that were killed, as far as that can be done.
void removeHostFileDrafts(int folder);

}  // namespace appsync::device
