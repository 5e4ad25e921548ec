// Inspection and events of a fake install-coordination service.
#include <algorithm>
#include <utility>

#include "kit/fakes/CallJournal.h"
#include "kit/fakes/FakeInstallCoordination.h"

namespace appsync::test {

using platform::ClientIdentity;
using platform::InstallObserverDelegate;

void FakeInstallCoordination::enable() {
  state_->update([this] { state_->isEnabled = true; });
}

void FakeInstallCoordination::installAutomatically() {
  state_->update([this] { state_->isAutomatic = true; });
}

void FakeInstallCoordination::completeUninstalls(CallbackOn where) {
  state_->update([&] { state_->uninstallCompletion = where; });
}

void FakeInstallCoordination::runUntilIdle() {
  gate.open();
  waitUntilIdle();
  gate.close();
}

// Contents.

namespace {

FakePlaceholder copyOf(const FakePlaceholder& placeholder) {
  FakePlaceholder copy = placeholder;
  if (copy.icon) copy.icon = std::make_shared<FakePromise>(*copy.icon);
  return copy;
}

}  // namespace

void FakeInstallCoordination::add(const FakeCoordinator& coordinator) {
  state_->update([&] {
    const auto added = std::make_shared<FakeCoordinator>(coordinator.snapshot());
    if (added->placeholder) state_->placeholders.push_back(added->placeholder);
    std::ranges::copy(added->promises(), std::back_inserter(state_->promises));
    state_->living.push_back(added);
  });
}

std::optional<FakeCoordinator> FakeInstallCoordination::coordinator(std::string_view identifier) const {
  for (const FakeCoordinator& coordinator : coordinators()) {
    if (coordinator.identifier == identifier) return coordinator;
  }
  return std::nullopt;
}

std::vector<FakeCoordinator> FakeInstallCoordination::coordinators() const {
  return state_->read([this] {
    std::vector<FakeCoordinator> copies;
    for (const auto& coordinator : state_->living)
      copies.push_back(coordinator->snapshot());
    return copies;
  });
}

std::vector<FakeCoordinator> FakeInstallCoordination::endedCoordinators() const {
  return state_->read([this] { return state_->ended; });
}

std::vector<FakePlaceholder> FakeInstallCoordination::placeholders() const {
  return state_->read([this] {
    std::vector<FakePlaceholder> copies;
    for (const auto& placeholder : state_->placeholders)
      copies.push_back(copyOf(*placeholder));
    return copies;
  });
}

std::optional<FakePlaceholder> FakeInstallCoordination::placeholder(std::string_view identifier) const {
  std::optional<FakePlaceholder> latest;
  for (FakePlaceholder& placeholder : placeholders()) {
    if (placeholder.identifier == identifier) latest = std::move(placeholder);
  }
  return latest;
}

std::vector<FakePromise> FakeInstallCoordination::promises() const {
  return state_->read([this] {
    std::vector<FakePromise> copies;
    for (const auto& promise : state_->promises)
      copies.push_back(*promise);
    return copies;
  });
}

std::optional<FakePromise> FakeInstallCoordination::promise(std::string_view name) const {
  std::optional<FakePromise> latest;
  for (FakePromise& promise : promises()) {
    if (promise.name == name) latest = std::move(promise);
  }
  return latest;
}

std::vector<std::string> FakeInstallCoordination::abandoned() const {
  std::vector<std::string> names;
  for (const FakePromise& promise : promises()) {
    if (!promise.isAttached && !promise.cancellation) names.push_back(promise.name);
  }
  for (const FakePlaceholder& placeholder : placeholders()) {
    if (!placeholder.isAttached && !placeholder.cancellation) names.push_back(placeholder.identifier);
  }
  return names;
}

std::vector<FakeInstallCoordination::Connection> FakeInstallCoordination::connections() const {
  return state_->read([this] { return state_->connections; });
}

// Events.

template <class Event>
void FakeInstallCoordination::apply(std::string_view identifier, CallbackOn where, const Event& event) {
  const Status status = state_->change(
      [&]() -> Status {
        const auto found = std::ranges::find(state_->living, identifier, &FakeCoordinator::identifier);
        if (found == state_->living.end()) return coordinationError("no coordinator of " + std::string(identifier));
        const CoordinationState::Coordinator coordinator = *found;
        return event(coordinator);
      },
      where);
  if (!status) misuse(status.error().text);
}

void FakeInstallCoordination::didInstallPlaceholder(std::string_view identifier, std::optional<Error> error,
                                                    CallbackOn where) {
  apply(identifier, where, [&](const auto& coordinator) {
    state_->showPlaceholder(coordinator, std::move(error));
    return Status();
  });
}

void FakeInstallCoordination::complete(std::string_view identifier, std::optional<Error> error, CallbackOn where) {
  apply(identifier, where, [&](const auto& coordinator) {
    state_->end(coordinator, std::move(error));
    state_->notify(coordinator, &InstallObserverDelegate::coordinatorDidCompleteSuccessfully);
    return Status();
  });
}

void FakeInstallCoordination::notify(std::string_view identifier, CallbackOn where,
                                     void (InstallObserverDelegate::*callback)(platform::InstallCoordinator&)) {
  apply(identifier, where, [&](const auto& coordinator) {
    state_->notify(coordinator, [callback](InstallObserverDelegate& delegate, platform::InstallCoordinator& handle) {
      (delegate.*callback)(handle);
    });
    return Status();
  });
}

void FakeInstallCoordination::prioritize(std::string_view identifier, CallbackOn where) {
  notify(identifier, where, &InstallObserverDelegate::coordinatorShouldPrioritize);
}

void FakeInstallCoordination::pause(std::string_view identifier, CallbackOn where) {
  notify(identifier, where, &InstallObserverDelegate::coordinatorShouldPause);
}

void FakeInstallCoordination::resume(std::string_view identifier, CallbackOn where) {
  notify(identifier, where, &InstallObserverDelegate::coordinatorShouldResume);
}

void FakeInstallCoordination::beginRestoringUserData(std::string_view identifier, CallbackOn where) {
  notify(identifier, where, &InstallObserverDelegate::coordinatorShouldBeginRestoringUserData);
}

void FakeInstallCoordination::cancelByUser(std::string_view identifier, CallbackOn where) {
  cancel(identifier, {coordinationError("the user deleted the app"), ClientIdentity::CXClientUser}, where);
}

void FakeInstallCoordination::cancel(std::string_view identifier, FakeCancellation cancellation, CallbackOn where) {
  apply(identifier, where,
        [&](const auto& coordinator) { return state_->cancel(coordinator, std::move(cancellation)); });
}

}  // namespace appsync::test
