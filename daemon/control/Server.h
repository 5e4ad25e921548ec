// Server end of a sync's control socket.
#pragma once

#include <functional>
#include <memory>
#include <string>
#include <thread>

#include "base/Error.h"
#include "daemon/control/Protocol.h"
#include "device/Device.h"
#include "device/storage/FileDescriptor.h"

namespace appsync::daemon {

/// Answers one request at a time on a dedicated thread. Clients that send nothing, or more than one line, are
/// disconnected after a time-out. They delay neither the sync nor the destructor.
class ControlServer {
 public:
  /// Carries out a request. Called on the server's thread.
  using Handler = std::function<ControlAnswer(const ControlRequest&)>;

  /// Creates the socket in the device's folder and starts the thread. The caller must have exclusive access to the
  /// device.
  [[nodiscard]] static Result<std::unique_ptr<ControlServer>> open(const std::string& devicePath, Handler handler);

  /// Removes the socket and waits for a running call of the handler.
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

/// Serves the requests for a running sync, as actions of the device's user, while the returned server exists. Fails if
/// the socket cannot be created. `device` must outlive the server.
[[nodiscard]] Result<std::unique_ptr<ControlServer>> openSyncControl(device::Device& device);

}  // namespace appsync::daemon
