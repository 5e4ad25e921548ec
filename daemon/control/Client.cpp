#include "daemon/control/Client.h"

#include <cerrno>
#include <chrono>
#include <optional>

#include "daemon/control/Socket.h"

namespace appsync::daemon {
namespace {

/// Longer than the server needs for several earlier clients.
constexpr auto kTimeout = std::chrono::seconds(10);

Error explain(const std::string& devicePath, const Error& error) {
  const auto say = [&](const std::string& sentence) {
    return Error{std::string(domains::kPOSIX), error.code, devicePath + ": " + sentence, nullptr};
  };
  switch (error.code) {
    case ENOENT:
    case ECONNREFUSED:
      return say("no sync is running; start `appsync sync`, and repeat this command while it runs");
    case ECONNRESET:
    case EPIPE:
      return say("the sync has just ended; the next sync offers the apps that it did not install");
    case EACCES:
    case EPERM:
      return say("the running sync belongs to another user; run this command as that user");
    case ETIMEDOUT:
    case EAGAIN:
      return say("the sync does not answer; try again");
    default:
      return error.in(devicePath);
  }
}

Result<std::string> converse(const std::string& devicePath, const std::string& line) {
  const Result<device::FileDescriptor> folder = openControlFolder(devicePath);
  if (!folder) return folder.error();
  const Result<device::FileDescriptor> connection = connectIn(folder->get());
  if (!connection) return connection.error();
  const Deadline deadline(kTimeout, -1);
  const Status sent = writeLine(connection->get(), line, deadline);
  // A server that closes the connection early may have sent the reason.
  if (!sent && sent.error().code != EPIPE) return sent.error();
  return readLine(connection->get(), deadline);
}

}  // namespace

Result<ControlAnswer> askSync(const std::string& devicePath, const ControlRequest& request) {
  const Result<std::string> line = converse(devicePath, lineOf(request));
  if (!line) return explain(devicePath, line.error());
  std::optional<ControlAnswer> answer = readAnswer(*line);
  if (!answer)
    return Error{std::string(domains::kPOSIX), EPROTO,
                 devicePath + ": the sync's answer is not valid; use the same release of appsync for both commands",
                 nullptr};
  return *std::move(answer);
}

}  // namespace appsync::daemon
