#include "daemon/control/Server.h"

#include <cerrno>
#include <chrono>
#include <utility>

#include <poll.h>
#include <sys/eventfd.h>
#include <sys/socket.h>
#include <unistd.h>

#include "daemon/control/Socket.h"

namespace appsync::daemon {
namespace {

using namespace std::chrono_literals;

/// For one connection, from its acceptance to its end.
constexpr auto kPatience = 2s;
/// For connections to come; then the wait begins anew.
constexpr auto kLongestPause = 1h;
/// When the system is out of something that an accepted connection needs.
constexpr auto kRest = 100ms;

std::string whyUnread(const Error& error) {
  return error.code == EMSGSIZE ? "the request is too long" : "the request did not come to its end";
}

}  // namespace

Result<std::unique_ptr<ControlServer>> ControlServer::open(const std::string& devicePath, Handler handler) {
  Result<device::FileDescriptor> folder = openControlFolder(devicePath);
  if (!folder) return folder.error();
  Result<device::FileDescriptor> socket = listenIn(folder->get());
  if (!socket) return socket.error();
  device::FileDescriptor wake(::eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK));
  if (!wake.valid()) return Error::fromErrno(errno, "eventfd");
  return std::unique_ptr<ControlServer>(
      new ControlServer(std::move(folder).value(), std::move(socket).value(), std::move(wake), std::move(handler)));
}

ControlServer::ControlServer(device::FileDescriptor folder, device::FileDescriptor socket, device::FileDescriptor wake,
                             Handler handler)
    : folder_(std::move(folder)),
      socket_(std::move(socket)),
      wake_(std::move(wake)),
      handler_(std::move(handler)),
      thread_([this] { run(); }) {}

ControlServer::~ControlServer() {
  // Nobody can connect any more, and whoever waits for an answer finds the connection closed.
  static_cast<void>(::unlinkat(folder_.get(), kControlSocket, 0));
  static_cast<void>(::eventfd_write(wake_.get(), 1));
  thread_.join();
}

void ControlServer::run() {
  for (;;) {
    const Status ready = ControlPatience(kLongestPause, wake_.get()).await(socket_.get(), POLLIN);
    if (!ready && ready.error().code == ECANCELED) return;
    const device::FileDescriptor connection(::accept4(socket_.get(), nullptr, nullptr, SOCK_CLOEXEC | SOCK_NONBLOCK));
    if (connection.valid()) {
      serve(connection.get());
    } else if (errno != EAGAIN && errno != EINTR && errno != ECONNABORTED) {
      ControlPatience(kRest, wake_.get()).await(-1, 0).ignore();
    }
  }
}

void ControlServer::serve(int connection) {
  const ControlAnswer answer = answerTo(connection);
  // Whoever does not wait for the answer does not want it.
  writeLine(connection, lineOf(answer), ControlPatience(kPatience, wake_.get())).ignore();
}

ControlAnswer ControlServer::answerTo(int connection) {
  if (!isOfThisUser(connection)) return {ControlResult::error, "the sync is another user's"};
  const Result<std::string> line = readLine(connection, ControlPatience(kPatience, wake_.get()));
  if (!line) return {ControlResult::error, whyUnread(line.error())};
  const std::optional<ControlRequest> request = readRequest(*line);
  return request ? handler_(*request) : ControlAnswer{ControlResult::error, "the request is not understood"};
}

}  // namespace appsync::daemon
