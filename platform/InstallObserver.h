// How clients of the install-coordination service hear of their coordinators.
#pragma once

#include <cstdint>

#include "base/Error.h"
#include "platform/ClientIdentity.h"

namespace appsync::platform {

class InstallCoordinator;

/// Hears of coordinators, on threads of the service's own: one callback at a time to each delegate, in the order in
/// which things happened, and none with a lock of the service held, so that a callback may call the service. No
/// operation of the service waits for a callback: a callback may wait until its client's operation has returned. A
/// coordinator is the service's and valid during the callback. Each is optional.
class InstallObserverDelegate {
 public:
  virtual ~InstallObserverDelegate() = default;

  /// coordinatorDidInstallPlaceholder: the home screen shows it now; or could not, and then the coordinator has an
  /// error.
  virtual void coordinatorDidInstallPlaceholder(InstallCoordinator& coordinator) { static_cast<void>(coordinator); }

  /// coordinatorDidCompleteSuccessfully: the install has ended: badly, in spite of the name, when the coordinator has
  /// an error.
  virtual void coordinatorDidCompleteSuccessfully(InstallCoordinator& coordinator) { static_cast<void>(coordinator); }

  /// coordinatorShouldPrioritize: somebody wants this app before the others.
  virtual void coordinatorShouldPrioritize(InstallCoordinator& coordinator) { static_cast<void>(coordinator); }

  /// coordinatorShouldPause:, coordinatorShouldResume: somebody wants its package to wait, or not to wait any more.
  virtual void coordinatorShouldPause(InstallCoordinator& coordinator) { static_cast<void>(coordinator); }
  virtual void coordinatorShouldResume(InstallCoordinator& coordinator) { static_cast<void>(coordinator); }

  /// coordinatorShouldBeginRestoringUserData: the app is there, and its data may come.
  virtual void coordinatorShouldBeginRestoringUserData(InstallCoordinator& coordinator) {
    static_cast<void>(coordinator);
  }

  /// coordinator:canceledWithReason:client: `client` has ended the install. Not told to those whose coordinator it is
  /// when `client` is its creator: who cancels knows it.
  virtual void coordinatorCanceledWithReason(InstallCoordinator& coordinator, const Error& reason,
                                             ClientIdentity client) {
    static_cast<void>(coordinator), static_cast<void>(reason), static_cast<void>(client);
  }

  /// promiseDidBeginFulfillmentWithIdentifier: the first part of a promise has come.
  virtual void promiseDidBeginFulfillmentWithIdentifier(std::uint64_t identifier) { static_cast<void>(identifier); }
};

/// A connection that reports the coordinators of some clients to a delegate for as long as it lives. When its
/// destructor has returned no callback runs on another thread and none will begin; on a callback's own thread it
/// returns at once.
class InstallObserver {
 public:
  virtual ~InstallObserver() = default;
};

}  // namespace appsync::platform
