// The Unix socket in a device's folder through which other processes reach a running sync.
#pragma once

#include <chrono>
#include <string>
#include <string_view>

#include "base/Error.h"
#include "device/storage/FileDescriptor.h"

namespace appsync::daemon {

/// The socket's name in the device's folder.
inline constexpr const char* kControlSocket = "control";

/// Makes the socket, in place of one that a killed sync left, and listens. Only this user can ever connect to it: it is
/// made with the mode 0600, and not narrowed to it afterwards. The caller holds the device. `folder` is its folder,
/// through which the socket is named: a socket's address is too short for many a path.
[[nodiscard]] Result<device::FileDescriptor> listenIn(int folder);

/// Connects to the sync that listens in that folder. ENOENT and ECONNREFUSED: there is none.
[[nodiscard]] Result<device::FileDescriptor> connectIn(int folder);

/// Opens a device's folder for the two.
[[nodiscard]] Result<device::FileDescriptor> openControlFolder(const std::string& devicePath);

/// Whether the process at the other end runs as this user.
[[nodiscard]] bool isOfThisUser(int connection);

/// Waits for connections, and for lines of a connection, no longer than allowed.
class ControlPatience {
 public:
  /// `wake` is a file that becomes readable when waiting is to end early, or -1.
  ControlPatience(std::chrono::milliseconds longest, int wake)
      : end_(std::chrono::steady_clock::now() + longest), wake_(wake) {}

  /// Until `file` is ready for `events` of poll. Errors: ETIMEDOUT, and ECANCELED when woken.
  [[nodiscard]] Status await(int file, short events) const;

 private:
  std::chrono::steady_clock::time_point end_;
  int wake_;
};

/// A whole line without its end. Errors: EMSGSIZE when it is longer than a line may be, ECONNRESET when the other side
/// leaves before its end, and those of waiting.
[[nodiscard]] Result<std::string> readLine(int connection, const ControlPatience& patience);
/// `line` with its end.
[[nodiscard]] Status writeLine(int connection, std::string_view line, const ControlPatience& patience);

}  // namespace appsync::daemon
