// What becomes of promises and placeholders that clients hold.
#include <algorithm>
#include <cmath>

#include "base/Describe.h"
#include "base/ReturnIfError.h"
#include "device/coordination/Coordinators.h"

namespace appsync::device {

using platform::ClientIdentity;
using platform::InstallObserverDelegate;
using platform::TSInstallState;

namespace {

/// An install's progress is counted in thousandths.
constexpr double kProgressUnits = 1000;

Error foreign(std::string_view what) {
  return coordinationError(CoordinationFailure::foreignClient,
                           "only the client that made the " + std::string(what) + " takes it back");
}

}  // namespace

void Coordinators::setFraction(const std::shared_ptr<PromiseState>& promise, double fraction) {
  const std::lock_guard lock(mutex_);
  if (isEnding_ || !promise->canChange()) return;
  promise->fraction = std::isnan(fraction) ? 0 : std::clamp(fraction, 0.0, 1.0);
  promise->hasUnsavedChanges = true;
  if (promise->role != PromiseRole::appAsset) return;
  if (const Coordinator coordinator = promise->coordinator.lock()) followPromise(*coordinator);
}

void Coordinators::followPromise(const CoordinatorState& coordinator) {
  if (!coordinator.appAsset || !coordinator.showsPlaceholder()) return;
  if (coordinator.stage != CoordinatorStage::waiting || coordinator.appAsset->fraction <= 0) return;
  const auto progress = registry_.runningInstalls().find(coordinator.identifier);
  if (progress == nullptr) return;
  if (progress->installState() == TSInstallState::Waiting) progress->setInstallState(TSInstallState::Active);
  progress->setCompletedUnitCount(std::llround(coordinator.appAsset->fraction * kProgressUnits));
}

void Coordinators::setTransferPath(const std::shared_ptr<PromiseState>& promise, const platform::FileLocation& path) {
  const std::lock_guard lock(mutex_);
  const bool isTheServices = promise->isComplete && promise->role;
  if (isEnding_ || !promise->canChange() || isTheServices) return;
  promise->transferPath = path;
  promise->hasUnsavedChanges = true;
}

void Coordinators::fulfil(const std::shared_ptr<PromiseState>& promise) {
  const std::lock_guard lock(mutex_);
  if (isEnding_ || !promise->canChange() || promise->isComplete) return;
  promise->isComplete = true;
  const Coordinator coordinator = promise->coordinator.lock();
  if (coordinator == nullptr || promise->role == PromiseRole::initialODRAsset) return;
  const auto store = [&](Database::Session& session) {
    coordinator_table::storePromise(session, coordinator->number, *promise->role, *promise).ignore();
  };
  if (promise->role == PromiseRole::icon && coordinator->showsPlaceholder()) {
    if (coordinator->stage == CoordinatorStage::waiting) show(*coordinator->placeholder, store).ignore();
    followPromise(*coordinator);
    endIfDemoted(coordinator);
    return;
  }
  // What cannot be stored is complete all the same, for as long as the service lives.
  this->store(*coordinator, store).ignore();
  advance(coordinator);
}

Status Coordinators::takeBack(const std::shared_ptr<PromiseState>& promise, ClientIdentity client) {
  const std::lock_guard lock(mutex_);
  RETURN_IF_ERROR(checkOpen());
  if (!promise->canChange()) return coordinationError(CoordinationFailure::ended, "the promise is over");
  const Coordinator coordinator = promise->coordinator.lock();
  if (promise->role && client != promise->client) return foreign("promise");
  if (coordinator && promise->role == PromiseRole::appAsset && coordinator->stage == CoordinatorStage::installing) {
    return coordinationError(CoordinationFailure::installing, "the app is just being installed");
  }
  if (coordinator && promise->role != PromiseRole::initialODRAsset) {
    PromiseState copy = *promise;
    copy.isCancelled = true;
    const auto store = [&](Database::Session& session) {
      coordinator_table::storePromise(session, coordinator->number, *promise->role, copy).ignore();
    };
    RETURN_IF_ERROR(this->store(*coordinator, store));
  }
  promise->isCancelled = true;
  return {};
}

std::string Coordinators::describe(const PromiseState& promise) const {
  const std::lock_guard lock(mutex_);
  std::string text = "<promise " + promise.name + ' ' + description(promise.fraction);
  if (promise.transferPath) text += " at " + promise.transferPath->path;
  if (promise.isComplete) text += " complete";
  if (promise.isCancelled) text += " cancelled";
  return text + '>';
}

Status Coordinators::configure(const std::shared_ptr<PlaceholderState>& placeholder, const Configuration& change) {
  const std::lock_guard lock(mutex_);
  RETURN_IF_ERROR(checkOpen());
  if (placeholder->isCancelled) return coordinationError(CoordinationFailure::ended, "the placeholder was given up");
  if (placeholder->isConfigured) {
    return coordinationError(CoordinationFailure::setBefore, "the placeholder's configuration is complete");
  }
  PlaceholderState copy = *placeholder;
  RETURN_IF_ERROR(change(copy));
  const Coordinator coordinator = placeholder->coordinator.lock();
  const bool isToShow = coordinator && copy.isConfigured && coordinator->stage == CoordinatorStage::waiting;
  if (coordinator) {
    const auto store = [&](Database::Session& session) {
      coordinator_table::storePlaceholder(session, coordinator->number, copy).ignore();
    };
    RETURN_IF_ERROR(isToShow ? show(copy, store) : this->store(*coordinator, store));
  }
  if (copy.icon) {
    copy.icon->role = PromiseRole::icon;
    copy.icon->coordinator = coordinator;
  }
  static_cast<PlaceholderConfiguration&>(*placeholder) = std::move(copy);
  if (!isToShow) return {};
  tell(coordinator, &InstallObserverDelegate::coordinatorDidInstallPlaceholder);
  followPromise(*coordinator);
  endIfDemoted(coordinator);
  return {};
}

Status Coordinators::takeBack(const std::shared_ptr<PlaceholderState>& placeholder, ClientIdentity client) {
  const std::lock_guard lock(mutex_);
  if (placeholder->isCancelled) return coordinationError(CoordinationFailure::ended, "the placeholder was given up");
  if (placeholder->isAttached) {
    return coordinationError(CoordinationFailure::notUsable, "the placeholder goes with its coordinator only");
  }
  if (client != placeholder->client) return foreign("placeholder");
  placeholder->isCancelled = true;
  if (placeholder->icon) placeholder->icon->isCancelled = true;
  return {};
}

}  // namespace appsync::device
