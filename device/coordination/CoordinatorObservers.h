// Who hears of coordinators.
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

/// Calls delegates back on one thread, one after the other. Threads: any, from callbacks too, unless said otherwise.
class CoordinatorObservers : public std::enable_shared_from_this<CoordinatorObservers> {
 public:
  /// What a delegate is told.
  using Report = std::function<void(platform::InstallObserverDelegate& delegate)>;
  /// A delegate of one coordinator's. `address` is compared only.
  struct Observer {
    std::weak_ptr<platform::InstallObserverDelegate> delegate;
    const void* address = nullptr;
  };

  /// A connection, which may outlive the service.
  [[nodiscard]] std::unique_ptr<platform::InstallObserver> connect(const std::set<platform::ClientIdentity>& clients,
                                                                   platform::InstallObserverDelegate& delegate);

  /// Tells all connections that want to hear of `creator`'s coordinators, and `observer`, each delegate once.
  void tell(platform::ClientIdentity creator, const Observer& observer, const Report& report);

  /// False when not everybody has been told everything by then. Not on the callbacks' thread.
  [[nodiscard]] bool waitUntilTold(std::chrono::steady_clock::time_point deadline);

  /// Nobody is told anything any more. Not on the callbacks' thread.
  void end() { callbacks_.stop(); }

 private:
  class Connection;

  void disconnect(const Connection& connection);
  void post(const void* receiver, std::function<void()> callback);

  std::mutex mutex_;
  std::vector<const Connection*> connections_;
  std::mutex pendingMutex_;
  std::condition_variable told_;
  /// Callbacks that are queued or running.
  std::size_t pending_ = 0;
  CallbackThread callbacks_;
};

}  // namespace appsync::device
