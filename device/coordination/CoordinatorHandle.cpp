#include "device/coordination/CoordinatorHandle.h"

#include <array>
#include <cstddef>

#include "device/coordination/Coordinators.h"
#include "device/coordination/PlaceholderHandle.h"
#include "device/coordination/PromiseHandles.h"
#include "plist/PropertyList.h"

namespace appsync::device {

using platform::ClientIdentity;

std::string_view nameOf(platform::CoordinatorKind kind) {
  constexpr std::array<std::string_view, 5> kNames{"any", "initiating", "updating", "restoring", "restoring demoted"};
  return kNames.at(static_cast<std::size_t>(kind));
}

std::optional<Error> CoordinatorHandle::coordinatorError() const {
  return coordinators_->read([this] { return state_->error; });
}

void CoordinatorHandle::setObserver(std::weak_ptr<platform::InstallObserverDelegate> observer) {
  const void* address = observer.lock().get();
  coordinators_->setObserver(state_, {std::move(observer), address});
}

bool CoordinatorHandle::hasInstallOptions() const {
  return coordinators_->read([this] { return state_->options.has_value(); });
}

Status CoordinatorHandle::setInstallOptions(const platform::InstallOptions& options) {
  CoordinatorOptions kept{options.installType(), options.installTargetType(), std::nullopt};
  if (options.storeMetadata()) {
    Result<Bytes> document = plist::writeBinary(options.storeMetadata()->dictionary());
    if (!document) return document.error().in("the store metadata");
    kept.storeMetadata = std::move(document).value();
  }
  return coordinators_->setOptions(state_, client_, std::move(kept));
}

bool CoordinatorHandle::hasInitialODRAssetPromises() const {
  return coordinators_->read([this] { return state_->hasInitialODRAssets; });
}

Status CoordinatorHandle::setInitialODRAssetPromises(
    const std::vector<std::shared_ptr<platform::InstallPromise>>& promises) {
  std::vector<std::shared_ptr<PromiseState>> states;
  states.reserve(promises.size());
  for (const auto& promise : promises)
    states.push_back(stateOf(*coordinators_, promise));
  return coordinators_->setInitialODRAssets(state_, client_, std::move(states));
}

bool CoordinatorHandle::hasAppAssetPromise() const {
  return coordinators_->read([this] { return state_->appAsset != nullptr; });
}

std::shared_ptr<platform::PromisedTransferToPath> CoordinatorHandle::appAssetPromise() const {
  const auto promise = coordinators_->read([this] { return state_->appAsset; });
  return promise == nullptr ? nullptr : std::make_shared<TransferToPathPromise>(coordinators_, promise);
}

Status CoordinatorHandle::setAppAssetPromise(std::shared_ptr<platform::PromisedTransferToPath> promise) {
  return coordinators_->setPromise(state_, client_, PromiseRole::appAsset, stateOf(*coordinators_, promise));
}

ClientIdentity CoordinatorHandle::appAssetPromiseResponsibleClient(ErrorSlot) const {
  return coordinators_->read([this] { return state_->responsibleClient.value_or(state_->creator); });
}

Status CoordinatorHandle::setAppAssetPromiseResponsibleClient(ClientIdentity client) {
  return coordinators_->setResponsibleClient(state_, client_, client);
}

bool CoordinatorHandle::hasUserDataPromise() const {
  return coordinators_->read([this] { return state_->userData != nullptr; });
}

Status CoordinatorHandle::setUserDataPromise(std::shared_ptr<platform::PromisedOutOfBandTransfer> promise) {
  return coordinators_->setPromise(state_, client_, PromiseRole::userData, stateOf(*coordinators_, promise));
}

bool CoordinatorHandle::hasPlaceholderPromise() const {
  return coordinators_->read([this] { return state_->placeholder != nullptr; });
}

Status CoordinatorHandle::setPlaceholderPromise(std::shared_ptr<platform::Placeholder> placeholder) {
  return coordinators_->setPlaceholder(state_, client_, stateOf(*coordinators_, placeholder));
}

Status CoordinatorHandle::cancelForReason(const Error& reason, ClientIdentity client) {
  return coordinators_->cancel(state_, reason, client);
}

std::string CoordinatorHandle::description() const {
  return '<' + std::string(nameOf(state_->kind)) + " coordinator " + state_->identifier + " of client " +
         std::to_string(static_cast<std::uint64_t>(state_->creator)) + '>';
}

}  // namespace appsync::device
