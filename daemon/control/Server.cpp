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

/// For a request and for its answer.
constexpr auto kTimeout = 2s;
/// For the next connection; the wait is then repeated.
constexpr auto kAcceptTimeout = 1h;
/// Pause before the next attempt when the system lacks resources for a connection.
constexpr auto kRetryPause = 100ms;

bool isBeingInstalled(device::InstallCoordination& coordination, const std::string& identifier) {
  return coordination.coordinatorForApp(platform::CoordinatorKind::any, identifier,
                                        platform::ClientIdentity::CXClientSync, platform::IfMissing::findNothing,
                                        nullptr, nullptr) != nullptr;
}

ControlAnswer carryOut(device::InstallCoordination& coordination, const ControlRequest& request) {
  const std::string& identifier = request.identifier;
  if (!isBeingInstalled(coordination, identifier)) {
    return {ControlResult::refused, identifier + " is not being installed; `appsync apps` shows which apps wait"};
  }
  if (request.verb == ControlVerb::prioritize) {
    if (coordination.prioritize(identifier)) return {ControlResult::done, {}};
    return {ControlResult::refused, "the install of " + identifier + " has just ended"};
  }
  const Status cancelled = coordination.cancelByUser(identifier);
  if (cancelled) return {ControlResult::done, {}};
  return {ControlResult::refused, identifier + " cannot be cancelled: " + cancelled.error().text};
}

std::string whyUnread(const Error& error) {
  return error.code == EMSGSIZE ? "the request is too long" : "the request is incomplete";
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
  // No client can connect any more, and the connections of waiting clients are closed.
  static_cast<void>(::unlinkat(folder_.get(), kControlSocket, 0));
  static_cast<void>(::eventfd_write(wake_.get(), 1));
  thread_.join();
}

void ControlServer::run() {
  for (;;) {
    const Status ready = Deadline(kAcceptTimeout, wake_.get()).await(socket_.get(), POLLIN);
    if (!ready && ready.error().code == ECANCELED) return;
    const device::FileDescriptor connection(::accept4(socket_.get(), nullptr, nullptr, SOCK_CLOEXEC | SOCK_NONBLOCK));
    if (connection.valid()) {
      serve(connection.get());
    } else if (errno != EAGAIN && errno != EINTR && errno != ECONNABORTED) {
      Deadline(kRetryPause, wake_.get()).await(-1, 0).ignore();
    }
  }
}

void ControlServer::serve(int connection) {
  const ControlAnswer answer = answerTo(connection);
  // A client may disconnect without waiting for the answer.
  writeLine(connection, lineOf(answer), Deadline(kTimeout, wake_.get())).ignore();
}

ControlAnswer ControlServer::answerTo(int connection) {
  if (!isOfThisUser(connection)) return {ControlResult::error, "the sync belongs to another user"};
  const Result<std::string> line = readLine(connection, Deadline(kTimeout, wake_.get()));
  if (!line) return {ControlResult::error, whyUnread(line.error())};
  const std::optional<ControlRequest> request = readRequest(*line);
  return request ? handler_(*request) : ControlAnswer{ControlResult::error, "the request is not valid"};
}

Result<std::unique_ptr<ControlServer>> openSyncControl(device::Device& device) {
  device::InstallCoordination& coordination = device.services().installCoordination();
  return ControlServer::open(
      device.path(), [&coordination](const ControlRequest& request) { return carryOut(coordination, request); });
}

}  // namespace appsync::daemon
