#include "kit/fakes/FakeCoordinator.h"

#include <utility>

namespace appsync::test {

using platform::ClientIdentity;
using platform::CoordinatorKind;

namespace {

template <class Change>
FakeCoordinator changed(const FakeCoordinator& coordinator, const Change& change) {
  FakeCoordinator copy = coordinator.snapshot();
  change(copy);
  return copy;
}

std::shared_ptr<FakePromise> attached(FakePromise promise) {
  promise.isAttached = true;
  return std::make_shared<FakePromise>(std::move(promise));
}

template <class T>
void separate(std::shared_ptr<T>& pointer) {
  if (pointer) pointer = std::make_shared<T>(*pointer);
}

}  // namespace

FakeCoordinator FakeCoordinator::of(std::string identifier, CoordinatorKind kind) {
  FakeCoordinator coordinator;
  coordinator.identifier = std::move(identifier);
  coordinator.kind = kind;
  return coordinator;
}

FakeCoordinator FakeCoordinator::madeBy(ClientIdentity client) const {
  return changed(*this, [&](FakeCoordinator& coordinator) { coordinator.creator = client; });
}

FakeCoordinator FakeCoordinator::withoutIdentifier() const {
  return changed(*this, [](FakeCoordinator& coordinator) { coordinator.hasLostIdentifier = true; });
}

FakeCoordinator FakeCoordinator::withError(Error value) const {
  return changed(*this, [&](FakeCoordinator& coordinator) { coordinator.error = std::move(value); });
}

FakeCoordinator FakeCoordinator::withOptions(platform::InstallOptions value) const {
  return changed(*this, [&](FakeCoordinator& coordinator) { coordinator.options = std::move(value); });
}

FakeCoordinator FakeCoordinator::withoutODRAssets() const {
  return changed(*this, [](FakeCoordinator& coordinator) { coordinator.initialODRAssets.emplace(); });
}

FakeCoordinator FakeCoordinator::withAppAsset(FakePromise promise) const {
  return changed(*this, [&](FakeCoordinator& coordinator) { coordinator.appAsset = attached(std::move(promise)); });
}

FakeCoordinator FakeCoordinator::withResponsibleClient(ClientIdentity client) const {
  return changed(*this, [&](FakeCoordinator& coordinator) { coordinator.responsibleClient = client; });
}

FakeCoordinator FakeCoordinator::withUserData(FakePromise promise) const {
  promise.kind = FakePromiseKind::outOfBand;
  return changed(*this, [&](FakeCoordinator& coordinator) { coordinator.userData = attached(std::move(promise)); });
}

FakeCoordinator FakeCoordinator::withPlaceholder(FakePlaceholder value) const {
  value.isAttached = true;
  return changed(*this, [&](FakeCoordinator& coordinator) {
    coordinator.placeholder = std::make_shared<FakePlaceholder>(std::move(value));
  });
}

FakeCoordinator FakeCoordinator::snapshot() const {
  FakeCoordinator copy = *this;
  separate(copy.appAsset);
  separate(copy.userData);
  separate(copy.placeholder);
  if (copy.placeholder) separate(copy.placeholder->icon);
  if (copy.initialODRAssets) {
    for (auto& promise : *copy.initialODRAssets)
      separate(promise);
  }
  return copy;
}

std::vector<std::shared_ptr<FakePromise>> FakeCoordinator::promises() const {
  std::vector<std::shared_ptr<FakePromise>> all;
  if (initialODRAssets) all = *initialODRAssets;
  if (appAsset) all.push_back(appAsset);
  if (userData) all.push_back(userData);
  if (placeholder && placeholder->icon) all.push_back(placeholder->icon);
  return all;
}

std::string_view nameOf(CoordinatorKind kind) {
  switch (kind) {
    case CoordinatorKind::any:
      return "any";
    case CoordinatorKind::initiating:
      return "initiating";
    case CoordinatorKind::updating:
      return "updating";
    case CoordinatorKind::restoring:
      return "restoring";
    case CoordinatorKind::restoringDemoted:
      return "restoringDemoted";
  }
  return "unknown";
}

}  // namespace appsync::test
