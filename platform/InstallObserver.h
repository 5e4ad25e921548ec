// Callbacks of the install-coordination service.
#pragma once

#include <cstdint>

#include "base/Error.h"
#include "platform/ClientIdentity.h"

namespace appsync::platform {

class InstallCoordinator;

/// Receives events of coordinators, on threads of the service. Callbacks to one delegate never overlap and are in the
/// order of the events. To avoid deadlocks, the service holds no lock during a callback, which may call the service,
/// and no operation of the service waits for a callback, which may wait for an operation to return. The service owns
/// the coordinator, a reference that is valid only during the callback. Implementing a callback is optional.
class InstallObserverDelegate {
 public:
  virtual ~InstallObserverDelegate() = default;

  /// coordinatorDidInstallPlaceholder: the home screen shows the placeholder or, if the coordinator has an error, could
  /// not show it.
  virtual void coordinatorDidInstallPlaceholder(InstallCoordinator& coordinator) { static_cast<void>(coordinator); }

  /// coordinatorDidCompleteSuccessfully: the install has ended. Despite the name, it failed if the coordinator has an
  /// error.
  virtual void coordinatorDidCompleteSuccessfully(InstallCoordinator& coordinator) { static_cast<void>(coordinator); }

  /// coordinatorShouldPrioritize: this app is to be installed before the others.
  virtual void coordinatorShouldPrioritize(InstallCoordinator& coordinator) { static_cast<void>(coordinator); }

  /// coordinatorShouldPause:, coordinatorShouldResume: delivery of the package is to be suspended or resumed.
  virtual void coordinatorShouldPause(InstallCoordinator& coordinator) { static_cast<void>(coordinator); }
  virtual void coordinatorShouldResume(InstallCoordinator& coordinator) { static_cast<void>(coordinator); }

  /// coordinatorShouldBeginRestoringUserData: the app is installed; its data can be restored.
  virtual void coordinatorShouldBeginRestoringUserData(InstallCoordinator& coordinator) {
    static_cast<void>(coordinator);
  }

  /// coordinator:canceledWithReason:client: `client` cancelled the install. Not delivered to the creator's observers if
  /// the creator itself cancelled.
  virtual void coordinatorCanceledWithReason(InstallCoordinator& coordinator, const Error& reason,
                                             ClientIdentity client) {
    static_cast<void>(coordinator), static_cast<void>(reason), static_cast<void>(client);
  }

  /// promiseDidBeginFulfillmentWithIdentifier: the first part of a promise was delivered.
  virtual void promiseDidBeginFulfillmentWithIdentifier(std::uint64_t identifier) { static_cast<void>(identifier); }
};

/// A connection that reports coordinators to a delegate. The destructor ends it: blocks until the running callback has
/// returned, unless called from that callback; no further callback begins.
class InstallObserver {
 public:
  virtual ~InstallObserver() = default;
};

}  // namespace appsync::platform
