// A running sync's ear for other processes.
#pragma once

#include <functional>
#include <memory>
#include <string>
#include <thread>

#include "base/Error.h"
#include "daemon/control/Protocol.h"
#include "device/storage/FileDescriptor.h"

namespace appsync::daemon {

/// Answers one request at a time on a thread of its own, for as long as it lives. Who says nothing, or too much, is
/// given up after a moment and holds up neither the sync nor its end.
class ControlServer {
 public:
  /// Carries out a request; called on the server's thread.
  using Handler = std::function<ControlAnswer(const ControlRequest&)>;

  /// Begins to listen in the device's folder. The caller holds the device.
  [[nodiscard]] static Result<std::unique_ptr<ControlServer>> open(const std::string& devicePath, Handler handler);

  /// Removes the socket; the handler is not called any more.
  ~ControlServer();
  ControlServer(const ControlServer&) = delete;
  ControlServer& operator=(const ControlServer&) = delete;

 private:
  ControlServer(device::FileDescriptor folder, device::FileDescriptor socket, device::FileDescriptor wake,
                Handler handler);

  void run();
  void serve(int connection);
  [[nodiscard]] ControlAnswer answerTo(int connection);

  const device::FileDescriptor folder_;
  const device::FileDescriptor socket_;
  const device::FileDescriptor wake_;
  const Handler handler_;
  std::thread thread_;
};

}  // namespace appsync::daemon
