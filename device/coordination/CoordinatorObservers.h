// The observers of coordinators.
#pragma once

#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <functional>
#include <memory>
#include <mutex>
#include <set>
#include <vector>

#include "device/services/CallbackThread.h"
#include "platform/InstallCoordinator.h"

namespace appsync::device {

/// Calls delegates on one thread, one at a time. Thread-safe; callable from callbacks unless documented otherwise.
class CoordinatorObservers : public std::enable_shared_from_this<CoordinatorObservers> {
 public:
  /// Calls the matching operation of a delegate.
  using Report = std::function<void(platform::InstallObserverDelegate& delegate)>;
  /// The delegate of a single coordinator. `address` identifies it and is never dereferenced.
  struct Observer {
    std::weak_ptr<platform::InstallObserverDelegate> delegate;
    const void* address = nullptr;
  };

  /// Connects a delegate to the coordinators of `clients`. The connection may outlive the service.
  [[nodiscard]] std::unique_ptr<platform::InstallObserver> connect(const std::set<platform::ClientIdentity>& clients,
                                                                   platform::InstallObserverDelegate& delegate);

  /// Reports to `observer` and to every connection for coordinators of `creator`, once to each delegate.
  void notify(platform::ClientIdentity creator, const Observer& observer, const Report& report);

  /// Blocks until all callbacks have returned. Returns false on time-out. Must not be called from a callback.
  [[nodiscard]] bool waitUntilDelivered(std::chrono::steady_clock::time_point deadline);

  /// Stops all callbacks. Must not be called from a callback.
  void end() { callbacks_.stop(); }

 private:
  class Connection;

  void disconnect(const Connection& connection);
  void post(const void* receiver, std::function<void()> callback);

  std::mutex mutex_;
  std::vector<const Connection*> connections_;
  std::mutex pendingMutex_;
  std::condition_variable delivered_;
  /// The number of queued and running callbacks.
  std::size_t pending_ = 0;
  CallbackThread callbacks_;
};

}  // namespace appsync::device
