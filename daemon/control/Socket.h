// The Unix socket in a device's folder that connects other processes to a running sync.
#pragma once

#include <chrono>
#include <string>
#include <string_view>

#include "base/Error.h"
#include "device/storage/FileDescriptor.h"

namespace appsync::daemon {

/// The socket's name in the device's folder.
inline constexpr const char* kControlSocket = "control";

/// Creates the socket with mode 0600, so that only this user can connect, and listens. Replaces the socket of a crashed
/// sync. `folder` is the open folder of the device, to which the caller must have exclusive access: the socket's
/// address is relative to it, because it is too short for long paths.
[[nodiscard]] Result<device::FileDescriptor> listenIn(int folder);

/// Connects to the sync that listens in that folder. Fails with ENOENT or ECONNREFUSED if no sync listens.
[[nodiscard]] Result<device::FileDescriptor> connectIn(int folder);

/// Opens a device's folder for `listenIn` and `connectIn`.
[[nodiscard]] Result<device::FileDescriptor> openControlFolder(const std::string& devicePath);

/// Returns whether the peer process runs as this user.
[[nodiscard]] bool isOfThisUser(int connection);

/// The end of a wait for connections or lines.
class Deadline {
 public:
  /// `wake` is a file descriptor that becomes readable to end the wait early, or -1.
  Deadline(std::chrono::milliseconds timeout, int wake)
      : end_(std::chrono::steady_clock::now() + timeout), wake_(wake) {}

  /// Blocks until `file` is ready for the poll `events`. Errors: ETIMEDOUT, or ECANCELED if `wake` is readable.
  [[nodiscard]] Status await(int file, short events) const;

 private:
  std::chrono::steady_clock::time_point end_;
  int wake_;
};

/// Reads a line and returns it without its end. Errors: EMSGSIZE if the line is too long, ECONNRESET if the peer
/// disconnects before its end, and those of `Deadline::await`.
[[nodiscard]] Result<std::string> readLine(int connection, const Deadline& deadline);
/// Writes `line`, which includes its end. Errors: those of the socket and of `Deadline::await`.
[[nodiscard]] Status writeLine(int connection, std::string_view line, const Deadline& deadline);

}  // namespace appsync::daemon
