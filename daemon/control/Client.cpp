#include "daemon/control/Client.h"

#include <cerrno>
#include <chrono>
#include <optional>

#include "daemon/control/Socket.h"

namespace appsync::daemon {
namespace {

/// More than several others need who are served before.
constexpr auto kPatience = std::chrono::seconds(10);

Error explained(const std::string& devicePath, const Error& error) {
  const auto say = [&](const std::string& sentence) {
    return Error{std::string(domains::kPOSIX), error.code, devicePath + ": " + sentence, nullptr};
  };
  switch (error.code) {
    case ENOENT:
    case ECONNREFUSED:
      return say("no sync is running; start one with `appsync sync`, and ask while it runs");
    case ECONNRESET:
    case EPIPE:
      return say("the sync has just ended; what it did not bring is offered again at the next one");
    case EACCES:
    case EPERM:
      return say("the sync that is running is another user's; ask as that user");
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
  const ControlPatience patience(kPatience, -1);
  const Status sent = writeLine(connection->get(), line, patience);
  // Whoever closed the connection may have said why.
  if (!sent && sent.error().code != EPIPE) return sent.error();
  return readLine(connection->get(), patience);
}

}  // namespace

Result<ControlAnswer> askSync(const std::string& devicePath, const ControlRequest& request) {
  const Result<std::string> line = converse(devicePath, lineOf(request));
  if (!line) return explained(devicePath, line.error());
  std::optional<ControlAnswer> answer = readAnswer(*line);
  if (!answer)
    return Error{std::string(domains::kPOSIX), EPROTO, devicePath + ": the sync's answer is not understood", nullptr};
  return *std::move(answer);
}

}  // namespace appsync::daemon
