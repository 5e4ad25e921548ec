// Who hears of running installs.
#pragma once

#include <functional>
#include <map>
#include <memory>
#include <mutex>

#include "device/services/CallbackThread.h"
#include "platform/AppRegistry.h"

namespace appsync::device {

/// Which installs run first, and which are paused.
struct InstallOrder {
  platform::AppRecords prioritized;
  platform::AppRecords paused;
};

/// Calls observers back on a thread that there is only while there are observers. A report says how things stand when
/// it is made: a slow observer hears of several changes at once and never falls behind.
///
/// Threads: any, from callbacks too. Must not be destroyed on a callback's thread.
class RegistryObservers {
 public:
  /// `order` answers how things stand, on the callbacks' thread.
  explicit RegistryObservers(std::function<InstallOrder()> order) : order_(std::move(order)) {}

  /// Nothing happens when it was added before; else it hears of the order soon.
  void add(platform::AppRegistryObserver& observer);
  /// When this returns no callback to it runs on another thread, and none will begin.
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
  /// Null while there are no observers, unless the last one left on this very thread.
  std::shared_ptr<CallbackThread> callbacks_;
};

}  // namespace appsync::device
