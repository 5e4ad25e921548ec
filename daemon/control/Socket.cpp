#include "daemon/control/Socket.h"

#include <array>
#include <cerrno>
#include <cstdio>

#include <fcntl.h>
#include <poll.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/time.h>
#include <sys/un.h>
#include <unistd.h>

#include "base/ReturnIfError.h"
#include "daemon/control/Protocol.h"

namespace appsync::daemon {
namespace {

constexpr int kQueuedConnections = 16;
/// For a place in the server's queue of connections.
constexpr timeval kConnectTimeout = {10, 0};

sockaddr_un addressIn(int folder) {
  sockaddr_un address = {};
  address.sun_family = AF_UNIX;
  std::snprintf(address.sun_path, sizeof address.sun_path, "/proc/self/fd/%d/%s", folder, kControlSocket);
  return address;
}

const sockaddr* generic(const sockaddr_un& address) {
  return reinterpret_cast<const sockaddr*>(&address);
}

Error failure(int error) {
  return Error::fromErrno(error, "the control socket of the sync");
}

bool isTransient(int error) {
  return error == EAGAIN || error == EINTR;
}

}  // namespace

Result<device::FileDescriptor> listenIn(int folder) {
  if (::unlinkat(folder, kControlSocket, 0) != 0 && errno != ENOENT) return failure(errno);
  device::FileDescriptor socket(::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0));
  const sockaddr_un address = addressIn(folder);
  // The mode of a socket that is not bound yet becomes that of its file.
  const bool listens = socket.valid() && ::fchmod(socket.get(), 0600) == 0 &&
                       ::bind(socket.get(), generic(address), sizeof address) == 0 &&
                       ::listen(socket.get(), kQueuedConnections) == 0;
  if (!listens) return failure(errno);
  return socket;
}

Result<device::FileDescriptor> connectIn(int folder) {
  device::FileDescriptor socket(::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0));
  const sockaddr_un address = addressIn(folder);
  const bool isConnected =
      socket.valid() &&
      ::setsockopt(socket.get(), SOL_SOCKET, SO_SNDTIMEO, &kConnectTimeout, sizeof kConnectTimeout) == 0 &&
      ::connect(socket.get(), generic(address), sizeof address) == 0 && ::fcntl(socket.get(), F_SETFL, O_NONBLOCK) == 0;
  if (!isConnected) return failure(errno);
  return socket;
}

Result<device::FileDescriptor> openControlFolder(const std::string& devicePath) {
  device::FileDescriptor folder(::open(devicePath.c_str(), O_PATH | O_DIRECTORY | O_CLOEXEC));
  if (!folder.valid()) return Error::fromErrno(errno, devicePath);
  return folder;
}

bool isOfThisUser(int connection) {
  ucred peer = {};
  socklen_t size = sizeof peer;
  return ::getsockopt(connection, SOL_SOCKET, SO_PEERCRED, &peer, &size) == 0 && peer.uid == ::geteuid();
}

Status Deadline::await(int file, short events) const {
  for (;;) {
    const auto left = std::chrono::ceil<std::chrono::milliseconds>(end_ - std::chrono::steady_clock::now());
    if (left.count() <= 0) return failure(ETIMEDOUT);
    std::array<pollfd, 2> files = {{{file, events, 0}, {wake_, POLLIN, 0}}};
    const int ready = ::poll(files.data(), files.size(), static_cast<int>(left.count()));
    if (ready < 0 && errno != EINTR) return failure(errno);
    if (ready > 0 && files[1].revents != 0) return failure(ECANCELED);
    if (ready > 0 && files[0].revents != 0) return {};
  }
}

Result<std::string> readLine(int connection, const Deadline& deadline) {
  std::string line;
  std::array<char, kLongestControlLine> piece = {};
  while (line.size() < kLongestControlLine) {
    RETURN_IF_ERROR(deadline.await(connection, POLLIN));
    const ssize_t count = ::recv(connection, piece.data(), kLongestControlLine - line.size(), 0);
    if (count < 0 && isTransient(errno)) continue;
    if (count <= 0) return failure(count < 0 ? errno : ECONNRESET);
    const std::string_view arrived(piece.data(), static_cast<std::size_t>(count));
    const std::size_t end = arrived.find('\n');
    line += arrived.substr(0, end);
    if (end != arrived.npos) return line;
  }
  return failure(EMSGSIZE);
}

Status writeLine(int connection, std::string_view line, const Deadline& deadline) {
  while (!line.empty()) {
    RETURN_IF_ERROR(deadline.await(connection, POLLOUT));
    const ssize_t count = ::send(connection, line.data(), line.size(), MSG_NOSIGNAL);
    if (count < 0 && !isTransient(errno)) return failure(errno);
    if (count > 0) line.remove_prefix(static_cast<std::size_t>(count));
  }
  return {};
}

}  // namespace appsync::daemon
