#include "kit/fakes/FakeInstallCoordinator.h"

#include <utility>

#include "kit/fakes/CallJournal.h"

namespace appsync::test {

using platform::ClientIdentity;
using platform::InstallPromise;
using platform::PromisedOutOfBandTransfer;
using platform::PromisedTransferToPath;

namespace {

std::shared_ptr<FakePromise> ownPromise(InstallPromise* promise) {
  if (promise == nullptr) return nullptr;
  if (auto* transfer = dynamic_cast<FakePromisedTransferToPath*>(promise)) return transfer->promise();
  if (auto* transfer = dynamic_cast<FakePromisedOutOfBandTransfer*>(promise)) return transfer->promise();
  misuse("a promise of another service");
  return nullptr;
}

Status checkUnattached(const FakePromise* promise) {
  if (promise == nullptr) return coordinationError("there is no promise");
  if (promise->cancellation) return coordinationError("the promise was cancelled");
  if (promise->isAttached) return coordinationError("the promise belongs to another install");
  return {};
}

std::string numberOf(ClientIdentity client) {
  return std::to_string(static_cast<std::uint64_t>(client));
}

}  // namespace

std::string textOf(const Error& reason, ClientIdentity client) {
  return reason.domain + " " + std::to_string(reason.code) + " " + numberOf(client);
}

Status attach(std::shared_ptr<FakePromise>& place, InstallPromise* promise) {
  if (place) return coordinationError("there is such a promise");
  std::shared_ptr<FakePromise> own = ownPromise(promise);
  if (Status status = checkUnattached(own.get()); !status) return status;
  own->isAttached = true;
  place = std::move(own);
  return {};
}

std::optional<Error> FakeInstallCoordinator::begin(std::string_view operation, std::string_view arguments) const {
  return state_->begin("coordinator." + std::string(operation), coordinator_->identifier, arguments);
}

template <class Field>
bool FakeInstallCoordinator::has(std::string_view operation, Field FakeCoordinator::*field) const {
  if (begin(operation)) return false;
  return state_->read([&] { return static_cast<bool>((*coordinator_).*field); });
}

template <class Field, class Change>
Status FakeInstallCoordinator::set(std::string_view operation, Field FakeCoordinator::*field,
                                   std::string_view arguments, const Change& change) {
  if (auto failure = begin(operation, arguments)) return *std::move(failure);
  return state_->change([&]() -> Status {
    checkDriver(operation);
    if (coordinator_->stage == FakeCoordinatorStage::ended) return coordinationError("the install has ended");
    if ((*coordinator_).*field) return coordinationError(std::string(operation) + " was called before");
    return change();
  });
}

void FakeInstallCoordinator::checkDriver(std::string_view operation) const {
  if (client_ == coordinator_->creator) return;
  if (operation == "setAppAssetPromise" && client_ == coordinator_->responsibleClient) return;
  misuse(std::string(operation) + " on " + description() + " of client " + numberOf(coordinator_->creator) +
         " by client " + numberOf(client_));
}

std::optional<std::string> FakeInstallCoordinator::bundleID() const {
  if (begin("bundleID") || coordinator_->hasLostIdentifier) return std::nullopt;
  return coordinator_->identifier;
}

ClientIdentity FakeInstallCoordinator::creatorIdentifier() const {
  static_cast<void>(begin("creatorIdentifier"));
  return coordinator_->creator;
}

std::optional<Error> FakeInstallCoordinator::coordinatorError() const {
  static_cast<void>(begin("coordinatorError"));
  return state_->read([&] { return coordinator_->error; });
}

void FakeInstallCoordinator::setObserver(std::weak_ptr<platform::InstallObserverDelegate> observer) {
  static_cast<void>(begin("setObserver"));
  state_->update([&] { coordinator_->observer = std::move(observer); });
}

bool FakeInstallCoordinator::hasInstallOptions() const {
  return has("hasInstallOptions", &FakeCoordinator::options);
}

Status FakeInstallCoordinator::setInstallOptions(const platform::InstallOptions& options) {
  return set("setInstallOptions", &FakeCoordinator::options, {}, [&] {
    coordinator_->options = options;
    return Status();
  });
}

bool FakeInstallCoordinator::hasInitialODRAssetPromises() const {
  return has("hasInitialODRAssetPromises", &FakeCoordinator::initialODRAssets);
}

Status FakeInstallCoordinator::setInitialODRAssetPromises(
    const std::vector<std::shared_ptr<InstallPromise>>& promises) {
  return set("setInitialODRAssetPromises", &FakeCoordinator::initialODRAssets, std::to_string(promises.size()),
             [&]() -> Status {
               std::vector<std::shared_ptr<FakePromise>> own;
               for (const auto& promise : promises) {
                 own.push_back(ownPromise(promise.get()));
                 if (Status status = checkUnattached(own.back().get()); !status) return status;
               }
               for (const auto& promise : own)
                 promise->isAttached = true;
               coordinator_->initialODRAssets = std::move(own);
               return {};
             });
}

bool FakeInstallCoordinator::hasAppAssetPromise() const {
  return has("hasAppAssetPromise", &FakeCoordinator::appAsset);
}

std::shared_ptr<PromisedTransferToPath> FakeInstallCoordinator::appAssetPromise() const {
  if (begin("appAssetPromise")) return nullptr;
  const std::shared_ptr<FakePromise> promise = state_->read([&] { return coordinator_->appAsset; });
  if (!promise) return nullptr;
  return std::make_shared<FakePromisedTransferToPath>(state_.shared(), promise);
}

Status FakeInstallCoordinator::setAppAssetPromise(std::shared_ptr<PromisedTransferToPath> promise) {
  return set("setAppAssetPromise", &FakeCoordinator::appAsset, promise ? promise->name() : "none",
             [&] { return attach(coordinator_->appAsset, promise.get()); });
}

ClientIdentity FakeInstallCoordinator::appAssetPromiseResponsibleClient(ErrorSlot error) const {
  if (auto failure = begin("appAssetPromiseResponsibleClient")) {
    setError(error, *std::move(failure));
    return ClientIdentity{0};
  }
  return state_->read([&] { return coordinator_->responsibleClient.value_or(coordinator_->creator); });
}

Status FakeInstallCoordinator::setAppAssetPromiseResponsibleClient(ClientIdentity client) {
  return set("setAppAssetPromiseResponsibleClient", &FakeCoordinator::responsibleClient, numberOf(client), [&] {
    coordinator_->responsibleClient = client;
    return Status();
  });
}

bool FakeInstallCoordinator::hasUserDataPromise() const {
  return has("hasUserDataPromise", &FakeCoordinator::userData);
}

Status FakeInstallCoordinator::setUserDataPromise(std::shared_ptr<PromisedOutOfBandTransfer> promise) {
  return set("setUserDataPromise", &FakeCoordinator::userData, promise ? promise->name() : "none",
             [&] { return attach(coordinator_->userData, promise.get()); });
}

bool FakeInstallCoordinator::hasPlaceholderPromise() const {
  return has("hasPlaceholderPromise", &FakeCoordinator::placeholder);
}

Status FakeInstallCoordinator::setPlaceholderPromise(std::shared_ptr<platform::Placeholder> placeholder) {
  return set("setPlaceholderPromise", &FakeCoordinator::placeholder, placeholder ? "" : "none", [&]() -> Status {
    if (!placeholder) return coordinationError("there is no placeholder");
    const auto* own = dynamic_cast<FakeAppPlaceholder*>(placeholder.get());
    if (own == nullptr) {
      misuse("a placeholder of another service");
      return coordinationError("the placeholder is not the service's");
    }
    FakePlaceholder& given = *own->placeholder();
    if (given.cancellation) return coordinationError("the placeholder was cancelled");
    if (given.isAttached || given.identifier != coordinator_->identifier) {
      return coordinationError("the placeholder belongs to another install");
    }
    given.isAttached = true;
    coordinator_->placeholder = own->placeholder();
    return {};
  });
}

Status FakeInstallCoordinator::cancelForReason(const Error& reason, ClientIdentity client) {
  if (auto failure = begin("cancelForReason", textOf(reason, client))) return *std::move(failure);
  return state_->change([&] { return state_->cancel(coordinator_, {reason, client}); });
}

std::string FakeInstallCoordinator::description() const {
  return "<" + std::string(nameOf(coordinator_->kind)) + " coordinator " + coordinator_->identifier + ">";
}

}  // namespace appsync::test
