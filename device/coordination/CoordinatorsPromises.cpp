// The operations of clients on promises and placeholders.
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

/// The total units of an install's progress.
constexpr double kProgressUnits = 1000;

Error foreign(std::string_view what) {
  return coordinationError(CoordinationFailure::foreignClient,
                           "only the creator of the " + std::string(what) + " may withdraw it");
}

}  // namespace

void Coordinators::setFraction(const std::shared_ptr<PromiseState>& promise, double fraction) {
  const std::lock_guard lock(mutex_);
  if (isEnding_ || !promise->isOpen()) return;
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
  const bool isOwnedByService = promise->isComplete && promise->role;
  if (isEnding_ || !promise->isOpen() || isOwnedByService) return;
  promise->transferPath = path;
  promise->hasUnsavedChanges = true;
}

void Coordinators::fulfil(const std::shared_ptr<PromiseState>& promise) {
  const std::lock_guard lock(mutex_);
  if (isEnding_ || !promise->isOpen() || promise->isComplete) return;
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
  // After a failure the promise is complete until the process ends.
  this->store(*coordinator, store).ignore();
  advance(coordinator);
}

Status Coordinators::withdraw(const std::shared_ptr<PromiseState>& promise, ClientIdentity client) {
  const std::lock_guard lock(mutex_);
  RETURN_IF_ERROR(checkOpen());
  if (!promise->isOpen()) return coordinationError(CoordinationFailure::ended, "the promise has ended");
  const Coordinator coordinator = promise->coordinator.lock();
  if (promise->role && client != promise->client) return foreign("promise");
  if (coordinator && promise->role == PromiseRole::appAsset && coordinator->stage == CoordinatorStage::installing) {
    return coordinationError(CoordinationFailure::installing, "the app is being installed");
  }
  if (coordinator && promise->role != PromiseRole::initialODRAsset) {
    PromiseState copy = *promise;
    copy.stage = PromiseStage::withdrawn;
    const auto store = [&](Database::Session& session) {
      coordinator_table::storePromise(session, coordinator->number, *promise->role, copy).ignore();
    };
    RETURN_IF_ERROR(this->store(*coordinator, store));
  }
  promise->stage = PromiseStage::withdrawn;
  return {};
}

std::string Coordinators::describe(const PromiseState& promise) const {
  const std::lock_guard lock(mutex_);
  std::string text = "<promise " + promise.name + ' ' + description(promise.fraction);
  if (promise.transferPath) text += " at " + promise.transferPath->path;
  if (promise.isComplete) text += " complete";
  if (promise.stage == PromiseStage::withdrawn) text += " cancelled";
  return text + '>';
}

Status Coordinators::configure(const std::shared_ptr<PlaceholderState>& placeholder, const Configuration& change) {
  const std::lock_guard lock(mutex_);
  RETURN_IF_ERROR(checkOpen());
  RETURN_IF_ERROR(checkOpen(*placeholder));
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
  notify(coordinator, &InstallObserverDelegate::coordinatorDidInstallPlaceholder);
  followPromise(*coordinator);
  endIfDemoted(coordinator);
  return {};
}

Status Coordinators::withdraw(const std::shared_ptr<PlaceholderState>& placeholder, ClientIdentity client) {
  const std::lock_guard lock(mutex_);
  RETURN_IF_ERROR(checkOpen(*placeholder));
  if (placeholder->isAttached) {
    return coordinationError(CoordinationFailure::notUsable,
                             "the placeholder belongs to a coordinator; cancel that instead");
  }
  if (client != placeholder->client) return foreign("placeholder");
  placeholder->stage = PromiseStage::withdrawn;
  if (placeholder->icon) placeholder->icon->stage = PromiseStage::withdrawn;
  return {};
}

}  // namespace appsync::device
