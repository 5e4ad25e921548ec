// The observers of running installs.
#pragma once

#include <functional>
#include <map>
#include <memory>
#include <mutex>

#include "device/services/CallbackThread.h"
#include "platform/AppRegistry.h"

namespace appsync::device {

/// The running and the paused installs, in their order.
struct InstallOrder {
  platform::AppRecords prioritized;
  platform::AppRecords paused;
};

/// Calls observers on a thread that exists only while there are observers. A report contains the order at the time of
/// the call: a slow observer receives one report for several changes.
///
/// Thread-safe, also in callbacks. Must not be destroyed on a callback's thread.
class RegistryObservers {
 public:
  /// `order` returns the current order; it is called on the callbacks' thread.
  explicit RegistryObservers(std::function<InstallOrder()> order) : order_(std::move(order)) {}

  /// Adds an observer and reports the order to it. Does nothing if it was already added.
  void add(platform::AppRegistryObserver& observer);
  /// Removes an observer and blocks until its running callback, unless this is that callback, has returned.
  void remove(platform::AppRegistryObserver& observer);

  void orderChanged();
  void cancelled(const std::shared_ptr<const platform::AppRecord>& record);

 private:
  struct State {
    bool reportQueued = false;
  };

  void postReport(platform::AppRegistryObserver& observer, State& state);

  const std::function<InstallOrder()> order_;
  std::mutex mutex_;
  std::map<platform::AppRegistryObserver*, State> observers_;
  /// Null while there are no observers, unless the last one was removed in a callback.
  std::shared_ptr<CallbackThread> callbacks_;
};

}  // namespace appsync::device
