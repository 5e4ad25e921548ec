// Installs and removals on the service's threads, and the resumption of an earlier process's coordinators.
#include <algorithm>

#include <unistd.h>

#include "device/coordination/CoordinatorHandle.h"
#include "device/coordination/Coordinators.h"
#include "device/storage/SystemCalls.h"

namespace appsync::device {

using platform::ClientIdentity;
using platform::InstallObserverDelegate;
using platform::TSInstallState;

namespace {

/// Returns the request of a coordinator. The placeholder's values are the defaults.
InstallRequest requestOf(const CoordinatorState& coordinator) {
  InstallRequest request;
  request.identifier = coordinator.identifier;
  request.installType = coordinator.placeholder->installType;
  request.licenceData = coordinator.placeholder->licence;
  request.defaultStoreMetadata = coordinator.placeholder->storeMetadata;
  if (coordinator.options) {
    request.installType = coordinator.options->installType;
    if (coordinator.options->storeMetadata) request.defaultStoreMetadata = coordinator.options->storeMetadata;
  }
  return request;
}

}  // namespace

void Coordinators::begin() {
  Result<CoordinatorList> left = [this] {
    Database::Session session(database_);
    return coordinator_table::all(session);
  }();
  if (!left) return;
  const std::lock_guard lock(mutex_);
  for (const Coordinator& coordinator : *left)
    coordinators_[coordinator->identifier].push_back(coordinator);
  for (const Coordinator& coordinator : *left) {
    ensurePlaceholderShown(*coordinator);
    // No process is loading its package.
    const auto progress = registry_.runningInstalls().find(coordinator->identifier);
    if (progress != nullptr) progress->setInstallState(TSInstallState::Waiting);
    advance(coordinator);
    endIfDemoted(coordinator);
  }
}

void Coordinators::ensurePlaceholderShown(const CoordinatorState& coordinator) {
  if (!coordinator.showsPlaceholder() || coordinator.stage != CoordinatorStage::waiting) return;
  const auto app = registry_.recordForIdentifier(coordinator.identifier, platform::PlaceholderLookup::on);
  const bool isShown = app != nullptr && app->isPlaceholder() && app->installProgress() != nullptr;
  // The app can be installed without a placeholder.
  if (!isShown) show(*coordinator.placeholder, [](Database::Session&) {}).ignore();
  followPromise(coordinator);
}

void Coordinators::end() {
  {
    const std::lock_guard lock(mutex_);
    isEnding_ = true;
  }
  // Removals first: they may wait for an install.
  removalQueue_.reset();
  installs_.reset();
  observers_->end();
  flushUnsavedPromises();
}

void Coordinators::flushUnsavedPromises() {
  const std::lock_guard lock(mutex_);
  std::vector<const CoordinatorState*> ahead;
  for (const auto& [identifier, ofApp] : coordinators_) {
    for (const Coordinator& coordinator : ofApp) {
      if (coordinator->appAsset && coordinator->appAsset->hasUnsavedChanges) ahead.push_back(coordinator.get());
    }
  }
  if (ahead.empty()) return;
  Database::Transaction transaction(database_);
  for (const CoordinatorState* coordinator : ahead) {
    coordinator_table::storePromise(transaction, coordinator->number, PromiseRole::appAsset, *coordinator->appAsset)
        .ignore();
  }
  transaction.commit().ignore();
}

void Coordinators::advance(const Coordinator& coordinator) {
  if (isEnding_ || !coordinator->isReady()) return;
  coordinator->stage = CoordinatorStage::installing;
  ++installing_;
  installs_->add([this, coordinator] { install(coordinator); });
}

void Coordinators::install(const Coordinator& coordinator) {
  InstallRequest request;
  {
    const std::lock_guard lock(mutex_);
    if (isEnding_) {
      coordinator->stage = CoordinatorStage::waiting;
      --installing_;
      changed_.notify_all();
      return;
    }
    request = requestOf(*coordinator);
  }
  // In the stage `installing` the app asset cannot change.
  request.transactionHook = [&](Database::Session& session) {
    coordinator_table::remove(session, *coordinator).ignore();
  };
  const auto& path = coordinator->appAsset->transferPath;
  const Status installed =
      path ? registry_.installPackage(*path, request)
           : coordinationError(CoordinationFailure::noPackage, "the app-asset promise was completed without a package");
  if (installed) removePackage(*coordinator);
  const std::lock_guard lock(mutex_);
  if (!installed) {
    registry_.runningInstalls().end(coordinator->identifier, TSInstallState::Failed);
    // After a failure the app is installed again when the device is next opened.
    if (erase(*coordinator)) removePackage(*coordinator);
  }
  close(coordinator, installed.failure());
  // The end of the install has removed the app's placeholder, which other coordinators need.
  for (const Coordinator& other : ofApp(coordinator->identifier))
    ensurePlaceholderShown(*other);
  notify(coordinator, &InstallObserverDelegate::coordinatorDidCompleteSuccessfully);
  --installing_;
  changed_.notify_all();
}

void Coordinators::removePackage(const CoordinatorState& coordinator) {
  const auto path = coordinator.ownPackage();
  if (!path) return;
  const Result<RootDirectory::Place> place = files_.root().place(*path);
  // Fails for a directory, which is not a package.
  if (place) static_cast<void>(sys::removeFile(place->folder.get(), place->name.c_str()));
  Database::Session session(database_);
  coordinator_table::forgetSpentPackage(session, *path).ignore();
}

bool Coordinators::isInstalling(std::string_view identifier) const {
  return std::ranges::any_of(ofApp(identifier), [](const Coordinator& coordinator) {
    return coordinator->stage == CoordinatorStage::installing;
  });
}

bool Coordinators::prioritize(std::string_view identifier) {
  const std::lock_guard lock(mutex_);
  const CoordinatorList coordinators = ofApp(identifier);
  if (coordinators.empty() || isEnding_) return false;
  registry_.prioritizeInstall(identifier);
  for (const Coordinator& coordinator : coordinators)
    notify(coordinator, &InstallObserverDelegate::coordinatorShouldPrioritize);
  return true;
}

void Coordinators::uninstall(std::string identifier, Completion completion) {
  {
    const std::lock_guard lock(mutex_);
    if (!isEnding_) {
      ++removals_;
      removalQueue_->add([this, identifier = std::move(identifier), completion = std::move(completion)] {
        completion(uninstallNow(identifier));
        const std::lock_guard counting(mutex_);
        --removals_;
        changed_.notify_all();
      });
      return;
    }
  }
  completion(checkOpen().failure());
}

std::optional<Error> Coordinators::uninstallNow(const std::string& identifier) {
  bool hadCoordinators = false;
  {
    std::unique_lock lock(mutex_);
    changed_.wait(lock, [&] { return !isInstalling(identifier); });
    const Error reason = coordinationError(CoordinationFailure::appRemoved, "the app is being removed");
    for (const Coordinator& coordinator : ofApp(identifier)) {
      hadCoordinators = true;
      const Status status = cancelNow(coordinator, reason, ClientIdentity::CXClientUser);
      if (!status) return status.failure();
    }
  }
  if (hadCoordinators && !registry_.applicationIsInstalled(identifier)) return std::nullopt;
  return registry_.uninstallApplication(identifier).failure();
}

bool Coordinators::waitUntilIdle(std::chrono::steady_clock::time_point deadline) {
  const auto isIdle = [this] { return installing_ == 0 && removals_ == 0; };
  for (;;) {
    {
      std::unique_lock lock(mutex_);
      if (!changed_.wait_until(lock, deadline, isIdle)) return false;
    }
    if (!observers_->waitUntilDelivered(deadline)) return false;
    // A callback may have started an install or removal.
    const std::lock_guard lock(mutex_);
    if (isIdle()) return true;
  }
}

}  // namespace appsync::device
