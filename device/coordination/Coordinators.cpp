#include "device/coordination/Coordinators.h"

#include <algorithm>

#include "base/ReturnIfError.h"
#include "device/apps/PlaceholderBundle.h"
#include "device/coordination/CoordinatorHandle.h"
#include "device/packages/BundleIdentifier.h"
#include "device/packages/InstallerError.h"

namespace appsync::device {

using platform::ClientIdentity;
using platform::CoordinatorKind;
using platform::InstallCoordinator;
using platform::InstallObserverDelegate;

namespace {

Status checkPromise(const std::shared_ptr<PromiseState>& promise) {
  if (promise == nullptr) {
    return coordinationError(CoordinationFailure::notUsable, "this is not a promise of the service");
  }
  if (promise->stage == PromiseStage::withdrawn) {
    return coordinationError(CoordinationFailure::ended, "the promise was withdrawn");
  }
  if (promise->role) return coordinationError(CoordinationFailure::notUsable, "the promise is already in use");
  return {};
}

PlaceholderContents contentsOf(const PlaceholderState& placeholder) {
  PlaceholderContents contents{placeholder.identifier, placeholder.bundleName,    placeholder.installType,
                               placeholder.attributes, placeholder.storeMetadata, std::nullopt};
  const auto& icon = placeholder.icon;
  if (icon && icon->isFulfilled() && icon->transferPath) contents.iconPath = icon->transferPath->path;
  return contents;
}

}  // namespace

Status Coordinators::checkOpen() const {
  if (isEnding_) return coordinationError(CoordinationFailure::closed, "the install-coordination service has ended");
  return {};
}

Status Coordinators::checkOpen(const PlaceholderState& placeholder) {
  if (placeholder.stage == PromiseStage::open) return {};
  return coordinationError(CoordinationFailure::ended, "the placeholder has ended");
}

Coordinators::CoordinatorList Coordinators::ofApp(std::string_view identifier) const {
  const auto found = coordinators_.find(identifier);
  return found == coordinators_.end() ? CoordinatorList() : found->second;
}

Coordinators::CoordinatorList Coordinators::all() const {
  const std::lock_guard lock(mutex_);
  CoordinatorList all;
  for (const auto& [identifier, ofApp] : coordinators_)
    all.insert(all.end(), ofApp.begin(), ofApp.end());
  std::ranges::sort(all, {}, [](const Coordinator& coordinator) { return coordinator->number; });
  return all;
}

Coordinators::Coordinator Coordinators::find(CoordinatorKind kind, std::string_view identifier,
                                             ClientIdentity client) const {
  const std::lock_guard lock(mutex_);
  const CoordinatorList candidates = ofApp(identifier);
  const auto isIt = [&](const Coordinator& coordinator) {
    return kind == CoordinatorKind::any ? coordinator->creator == client : coordinator->kind == kind;
  };
  const auto found = std::ranges::find_if(candidates, isIt);
  if (found != candidates.end()) return *found;
  return kind == CoordinatorKind::any && !candidates.empty() ? candidates.front() : nullptr;
}

Result<Coordinators::Coordinator> Coordinators::findOrMake(CoordinatorKind kind, std::string_view identifier,
                                                           ClientIdentity client, bool& isNew) {
  const std::lock_guard lock(mutex_);
  isNew = false;
  for (const Coordinator& coordinator : ofApp(identifier)) {
    if (coordinator->kind == kind) return coordinator;
  }
  RETURN_IF_ERROR(checkOpen());
  const auto coordinator = std::make_shared<CoordinatorState>();
  coordinator->identifier = identifier;
  coordinator->kind = kind;
  coordinator->creator = client;
  {
    Database::Transaction transaction(database_);
    RETURN_IF_ERROR(asSystemError(coordinator_table::insert(transaction, *coordinator)));
    RETURN_IF_ERROR(asSystemError(transaction.commit()));
  }
  coordinators_[coordinator->identifier].push_back(coordinator);
  isNew = true;
  return coordinator;
}

Status Coordinators::mayChange(const CoordinatorState& coordinator, ClientIdentity client, bool wasSet) const {
  RETURN_IF_ERROR(checkOpen());
  if (coordinator.stage == CoordinatorStage::ended) {
    return coordinationError(CoordinationFailure::ended, "the coordinator has ended");
  }
  if (client != coordinator.creator) {
    return coordinationError(CoordinationFailure::foreignClient, "only the creator of the coordinator may change it");
  }
  if (wasSet) return coordinationError(CoordinationFailure::setBefore, "this was set before");
  return {};
}

Status Coordinators::store(const CoordinatorState& coordinator, const TransactionHook& store) {
  // While the app is being installed, the transaction that records it deletes the rows.
  if (coordinator.stage != CoordinatorStage::waiting) return {};
  Database::Transaction transaction(database_);
  store(transaction);
  RETURN_IF_ERROR(asSystemError(transaction.commit()));
  return {};
}

Status Coordinators::choose(const Coordinator& coordinator, CoordinatorChoices choices) {
  const auto store = [&](Database::Session& session) {
    coordinator_table::storeChoices(session, coordinator->number, choices).ignore();
  };
  RETURN_IF_ERROR(this->store(*coordinator, store));
  static_cast<CoordinatorChoices&>(*coordinator) = std::move(choices);
  advance(coordinator);
  return {};
}

void Coordinators::setObserver(const Coordinator& coordinator, CoordinatorObservers::Observer observer) {
  const std::lock_guard lock(mutex_);
  coordinator->observer = std::move(observer);
}

Status Coordinators::setOptions(const Coordinator& coordinator, ClientIdentity client, CoordinatorOptions options) {
  const std::lock_guard lock(mutex_);
  RETURN_IF_ERROR(mayChange(*coordinator, client, coordinator->options.has_value()));
  CoordinatorChoices choices = *coordinator;
  choices.options = std::move(options);
  return choose(coordinator, std::move(choices));
}

Status Coordinators::setInitialODRAssets(const Coordinator& coordinator, ClientIdentity client,
                                         std::vector<std::shared_ptr<PromiseState>> promises) {
  const std::lock_guard lock(mutex_);
  RETURN_IF_ERROR(mayChange(*coordinator, client, coordinator->hasInitialODRAssets));
  for (const auto& promise : promises) {
    const bool isTwice = std::ranges::count(promises, promise) > 1;
    RETURN_IF_ERROR(checkPromise(isTwice ? nullptr : promise));
  }
  CoordinatorChoices choices = *coordinator;
  choices.hasInitialODRAssets = true;
  choices.initialODRAssets = promises;
  RETURN_IF_ERROR(choose(coordinator, std::move(choices)));
  for (const auto& promise : promises) {
    promise->role = PromiseRole::initialODRAsset;
    promise->coordinator = coordinator;
  }
  return {};
}

Status Coordinators::setResponsibleClient(const Coordinator& coordinator, ClientIdentity client,
                                          ClientIdentity responsible) {
  const std::lock_guard lock(mutex_);
  RETURN_IF_ERROR(mayChange(*coordinator, client, coordinator->responsibleClient.has_value()));
  CoordinatorChoices choices = *coordinator;
  choices.responsibleClient = responsible;
  return choose(coordinator, std::move(choices));
}

Status Coordinators::setPromise(const Coordinator& coordinator, ClientIdentity client, PromiseRole role,
                                std::shared_ptr<PromiseState> promise) {
  const std::lock_guard lock(mutex_);
  const bool isAppAsset = role == PromiseRole::appAsset;
  auto& place = isAppAsset ? coordinator->appAsset : coordinator->userData;
  const ClientIdentity responsible = coordinator->responsibleClient.value_or(coordinator->creator);
  const bool mayDrive = isAppAsset && client == responsible;
  RETURN_IF_ERROR(mayChange(*coordinator, mayDrive ? coordinator->creator : client, place != nullptr));
  RETURN_IF_ERROR(checkPromise(promise));
  if (isAppAsset && promise->client != responsible) {
    return coordinationError(CoordinationFailure::foreignClient,
                             "another client is responsible for the app-asset promise");
  }
  const auto store = [&](Database::Session& session) {
    coordinator_table::storePromise(session, coordinator->number, role, *promise).ignore();
  };
  RETURN_IF_ERROR(this->store(*coordinator, store));
  promise->role = role;
  promise->coordinator = coordinator;
  place = std::move(promise);
  followPromise(*coordinator);
  advance(coordinator);
  return {};
}

Status Coordinators::setPlaceholder(const Coordinator& coordinator, ClientIdentity client,
                                    const std::shared_ptr<PlaceholderState>& placeholder) {
  const std::lock_guard lock(mutex_);
  RETURN_IF_ERROR(mayChange(*coordinator, client, coordinator->placeholder != nullptr));
  if (placeholder == nullptr || placeholder->isAttached || placeholder->identifier != coordinator->identifier) {
    return coordinationError(CoordinationFailure::notUsable, "this is not a placeholder for the coordinator");
  }
  RETURN_IF_ERROR(checkOpen(*placeholder));
  const auto store = [&](Database::Session& session) {
    coordinator_table::storePlaceholder(session, coordinator->number, *placeholder).ignore();
  };
  RETURN_IF_ERROR(placeholder->isConfigured ? show(*placeholder, store) : this->store(*coordinator, store));
  coordinator->placeholder = placeholder;
  placeholder->isAttached = true;
  placeholder->coordinator = coordinator;
  if (placeholder->icon) placeholder->icon->coordinator = coordinator;
  if (placeholder->isConfigured) notify(coordinator, &InstallObserverDelegate::coordinatorDidInstallPlaceholder);
  followPromise(*coordinator);
  advance(coordinator);
  endIfDemoted(coordinator);
  return {};
}

void Coordinators::endIfDemoted(const Coordinator& coordinator) {
  const bool hasDone = coordinator->kind == CoordinatorKind::restoringDemoted && coordinator->showsPlaceholder() &&
                       coordinator->appAsset == nullptr && coordinator->stage == CoordinatorStage::waiting;
  if (!hasDone) return;
  const auto& icon = coordinator->placeholder->icon;
  if (icon && icon->isOpen() && !icon->isComplete) return;
  Database::Transaction transaction(database_);
  coordinator_table::remove(transaction, *coordinator).ignore();
  // After a failure the coordinator ends when the device is next opened.
  if (transaction.commit()) close(coordinator, std::nullopt);
}

bool Coordinators::reinstallsDemotedApp(const PlaceholderState& placeholder) const {
  return !isDemotion(placeholder.installType) && registry_.isDemoted(placeholder.identifier);
}

Status Coordinators::show(const PlaceholderState& placeholder, const TransactionHook& store) {
  if (reinstallsDemotedApp(placeholder)) return registry_.beginReturn(placeholder.identifier, store);
  Result<PlaceholderContainer> made = makePlaceholder(files_, contentsOf(placeholder));
  if (!made) return made.error();
  RETURN_IF_ERROR(made->container.commit(Durability::process));
  InstallRequest request;
  request.role = BundleRole::placeholder;
  request.identifier = placeholder.identifier;
  request.installType = placeholder.installType;
  request.licenceData = placeholder.licence;
  request.transactionHook = store;
  return registry_.recordPlaceholder(made->container, request, std::move(made->bundle));
}

Status Coordinators::cancel(const Coordinator& coordinator, const Error& reason, ClientIdentity client) {
  const std::lock_guard lock(mutex_);
  RETURN_IF_ERROR(checkOpen());
  return cancelNow(coordinator, reason, client);
}

Status Coordinators::cancelAll(std::string_view identifier, const Error& reason, ClientIdentity client) {
  const std::lock_guard lock(mutex_);
  RETURN_IF_ERROR(checkOpen());
  const CoordinatorList coordinators = ofApp(identifier);
  if (coordinators.empty()) {
    return coordinationError(CoordinationFailure::noCoordinator,
                             "\"" + std::string(identifier) + "\" is not being installed");
  }
  if (isInstalling(identifier)) {
    return coordinationError(
        CoordinationFailure::installing,
        "\"" + std::string(identifier) + "\" is being installed; wait until the install has ended");
  }
  for (const Coordinator& coordinator : coordinators) {
    RETURN_IF_ERROR(cancelNow(coordinator, reason, client));
  }
  return {};
}

Status Coordinators::cancelNow(const Coordinator& coordinator, const Error& reason, ClientIdentity client) {
  if (coordinator->stage == CoordinatorStage::ended) {
    return coordinationError(CoordinationFailure::ended, "the coordinator has ended");
  }
  if (coordinator->stage == CoordinatorStage::installing) {
    return coordinationError(CoordinationFailure::installing, "the app is being installed");
  }
  RETURN_IF_ERROR(erase(*coordinator));
  removePackage(*coordinator);
  close(coordinator, reason);
  if (client == coordinator->creator) return {};
  notify(coordinator, [reason, client](InstallObserverDelegate& delegate, InstallCoordinator& handle) {
    delegate.coordinatorCanceledWithReason(handle, reason, client);
  });
  return {};
}

Status Coordinators::erase(const CoordinatorState& coordinator) {
  const auto remove = [&](Database::Session& session) { coordinator_table::remove(session, coordinator).ignore(); };
  const CoordinatorList coordinators = ofApp(coordinator.identifier);
  const bool isShownByAnother = std::ranges::any_of(
      coordinators, [&](const Coordinator& other) { return other.get() != &coordinator && other->showsPlaceholder(); });
  const bool goesAlone = coordinator.showsPlaceholder() && !isShownByAnother;
  const bool staysDemoted = goesAlone && reinstallsDemotedApp(*coordinator.placeholder);
  if (goesAlone && !staysDemoted) {
    Status removed = registry_.removePlaceholder(coordinator.identifier, remove);
    const bool isGone = !removed && removed.error().domain == platform::kInstallerErrorDomain;
    if (!isGone) return removed;
  }
  {
    Database::Transaction transaction(database_);
    remove(transaction);
    RETURN_IF_ERROR(asSystemError(transaction.commit()));
  }
  if (staysDemoted) registry_.runningInstalls().end(coordinator.identifier, platform::TSInstallState::Canceled);
  return {};
}

void Coordinators::close(const Coordinator& coordinator, std::optional<Error> error) {
  coordinator->stage = CoordinatorStage::ended;
  coordinator->error = std::move(error);
  const auto end = [](const auto& state) {
    if (state && state->stage == PromiseStage::open) state->stage = PromiseStage::ended;
  };
  std::ranges::for_each(coordinator->initialODRAssets, end);
  end(coordinator->appAsset);
  end(coordinator->userData);
  end(coordinator->placeholder);
  if (coordinator->placeholder) end(coordinator->placeholder->icon);
  const auto ofApp = coordinators_.find(coordinator->identifier);
  std::erase(ofApp->second, coordinator);
  if (ofApp->second.empty()) coordinators_.erase(ofApp);
}

void Coordinators::notify(const Coordinator& coordinator, Report report) {
  const auto handle = std::make_shared<CoordinatorHandle>(shared_from_this(), coordinator, coordinator->creator);
  observers_->notify(
      coordinator->creator, coordinator->observer,
      [handle, report = std::move(report)](InstallObserverDelegate& delegate) { report(delegate, *handle); });
}

}  // namespace appsync::device
