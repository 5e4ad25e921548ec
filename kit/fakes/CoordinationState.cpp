#include "kit/fakes/CoordinationState.h"

#include <algorithm>
#include <utility>

#include "kit/fakes/FakeInstallCoordinator.h"
#include "platform/InstallCoordination.h"
#include "platform/Keys.h"

namespace appsync::test {

using platform::ClientIdentity;
using platform::CoordinatorKind;
using platform::InstallCoordinator;
using platform::InstallObserverDelegate;

namespace {

/// Any code except 1.
constexpr long kRefused = 2;

/// Returns the registry's install options for the coordinator's options.
plist::Dictionary installerOptions(const FakeCoordinator& coordinator) {
  plist::Dictionary options{{platform::PackageTypeKey, platform::kPackageTypeCustomer},
                            {platform::BundleIdentifierKey, coordinator.identifier}};
  platform::TSInstallType type = platform::TSInstallType::None;
  std::optional<platform::StoreMetadata> metadata;
  if (coordinator.placeholder) {
    type = coordinator.placeholder->installType;
    metadata = coordinator.placeholder->metadata.value_or(std::nullopt);
    if (coordinator.placeholder->sinfData) options.set(platform::kLicenceDataKey, *coordinator.placeholder->sinfData);
  }
  if (coordinator.options) {
    type = coordinator.options->installType();
    if (coordinator.options->storeMetadata()) metadata = coordinator.options->storeMetadata();
  }
  options.set(platform::kInstallTypeKey, static_cast<std::uint64_t>(type));
  if (!metadata) return options;
  if (Result<Bytes> bytes = plist::writeBinary(metadata->dictionary())) {
    options.set(platform::kStoreMetadataKey, *std::move(bytes));
  }
  return options;
}

bool isComplete(const std::shared_ptr<FakePromise>& promise) {
  return promise && promise->isComplete && !promise->cancellation;
}

}  // namespace

Error coordinationError(std::string text) {
  return {std::string(platform::kInstallCoordinationErrorDomain), kRefused, std::move(text), nullptr};
}

std::optional<Error> CoordinationState::begin(std::string_view operation, std::string_view subject,
                                              std::string_view arguments) {
  std::string line(subject);
  if (!arguments.empty()) line.append(" ").append(arguments);
  if (auto failure = journal_.beforeCall(operation, line)) return failure;
  return failures.take(std::string(operation), subject);
}

Status CoordinationState::change(const Change& change, CallbackOn where) {
  std::vector<Delivery> here;
  Status status;
  {
    const std::scoped_lock lock(mutex_);
    status = change();
    if (where == CallbackOn::callingThread) here.swap(deliveries_);
    for (Delivery& delivery : std::exchange(deliveries_, {}))
      thread_.post(delivery.subscription, [this, call = std::move(delivery.call)] { gate.pass(), call(); });
    advance();
  }
  for (const Delivery& delivery : here)
    delivery.call();
  return status;
}

void CoordinationState::post(std::function<void()> work) {
  thread_.post(own_, [this, work = std::move(work)] { gate.pass(), work(); });
}

CoordinationState::Coordinator CoordinationState::find(CoordinatorKind kind, std::string_view identifier,
                                                       ClientIdentity client) const {
  Coordinator others;
  for (const Coordinator& coordinator : living) {
    if (coordinator->identifier != identifier) continue;
    if (kind != CoordinatorKind::any && coordinator->kind != kind) continue;
    if (kind != CoordinatorKind::any || coordinator->creator == client) return coordinator;
    if (!others) others = coordinator;
  }
  return others;
}

// Automatic actions.

bool CoordinationState::isFulfilled(const FakeCoordinator& coordinator) const {
  const bool restores =
      coordinator.kind == CoordinatorKind::restoring || coordinator.kind == CoordinatorKind::restoringDemoted;
  return coordinator.stage == FakeCoordinatorStage::waiting && (coordinator.options || restores) &&
         coordinator.placeholder && isComplete(coordinator.appAsset) &&
         (!coordinator.userData || isComplete(coordinator.userData));
}

void CoordinationState::advance() {
  if (!isAutomatic) return;
  for (const Coordinator& coordinator : living) {
    if (coordinator->placeholder && coordinator->placeholder->isConfigured &&
        coordinator->showing == FakeShowing::notBegun) {
      coordinator->showing = FakeShowing::underWay;
      post([this, coordinator] {
        update([&] {
          if (coordinator->stage == FakeCoordinatorStage::ended) return;
          showPlaceholder(coordinator, failures.take(std::string(kShowingPlaceholder), coordinator->identifier));
        });
      });
    }
    if (!isFulfilled(*coordinator)) continue;
    coordinator->appAsset->isTaken = true;
    // The placeholder is reported first.
    if (coordinator->showing != FakeShowing::underWay) {
      coordinator->stage = FakeCoordinatorStage::installing;
      post([this, coordinator] { install(coordinator); });
    }
  }
}

void CoordinationState::showPlaceholder(const Coordinator& coordinator, std::optional<Error> error) {
  coordinator->showing = FakeShowing::over;
  if (error) {
    coordinator->error = std::move(error);
  } else if (coordinator->placeholder) {
    coordinator->placeholder->isShown = true;
    registry_.showPlaceholder(coordinator->identifier, coordinator->placeholder->installType);
  }
  notify(coordinator, &InstallObserverDelegate::coordinatorDidInstallPlaceholder);
}

void CoordinationState::install(const Coordinator& coordinator) {
  // Nothing changes a coordinator that is installing.
  const FakeCoordinator now = read([&] { return coordinator->snapshot(); });
  const Status status = installPackage(now);
  removePackage(now);
  update([&] {
    end(coordinator, status.failure());
    notify(coordinator, &InstallObserverDelegate::coordinatorDidCompleteSuccessfully);
  });
}

Status CoordinationState::installPackage(const FakeCoordinator& coordinator) {
  if (!coordinator.appAsset->transferPath) return coordinationError("the app-asset promise has no transfer path");
  return registry_.install(*coordinator.appAsset->transferPath, installerOptions(coordinator));
}

void CoordinationState::removePackage(const FakeCoordinator& coordinator) {
  if (isComplete(coordinator.appAsset) && coordinator.appAsset->transferPath) {
    files_.erase(coordinator.appAsset->transferPath->path);
  }
}

void CoordinationState::end(const Coordinator& coordinator, std::optional<Error> error) {
  coordinator->stage = FakeCoordinatorStage::ended;
  if (error) coordinator->error = std::move(error);
  for (const auto& promise : coordinator->promises())
    promise->hasEnded = true;
  if (coordinator->placeholder && std::exchange(coordinator->placeholder->isShown, false)) {
    registry_.removePlaceholder(coordinator->identifier);
  }
  std::erase(living, coordinator);
  ended.push_back(coordinator->snapshot());
}

Status CoordinationState::cancel(const Coordinator& coordinator, FakeCancellation cancellation) {
  if (coordinator->stage == FakeCoordinatorStage::ended) return coordinationError("the install has ended");
  if (coordinator->stage == FakeCoordinatorStage::installing) return coordinationError("the app is being installed");
  removePackage(*coordinator);
  for (const auto& promise : coordinator->promises()) {
    if (!promise->cancellation) promise->cancellation = cancellation;
  }
  if (coordinator->placeholder) coordinator->placeholder->cancellation = cancellation;
  coordinator->cancellation = cancellation;
  end(coordinator, cancellation.reason);
  if (cancellation.client == coordinator->creator) return {};
  notify(coordinator, [cancellation](InstallObserverDelegate& delegate, InstallCoordinator& handle) {
    delegate.coordinatorCanceledWithReason(handle, cancellation.reason, cancellation.client);
  });
  return {};
}

void CoordinationState::notify(const Coordinator& coordinator, const Report& report) {
  const auto notified = std::make_shared<std::set<InstallObserverDelegate*>>();
  const auto notifyOnce = [this, coordinator, report, notified](InstallObserverDelegate& delegate) {
    if (!notified->insert(&delegate).second) return;
    FakeInstallCoordinator handle(shared_from_this(), coordinator, coordinator->creator);
    report(delegate, handle);
  };
  for (const Connection& connection : connections) {
    if (!connection.isOpen || !connection.clients.contains(coordinator->creator)) continue;
    deliveries_.push_back(
        {connection.subscription, [notifyOnce, delegate = connection.delegate] { notifyOnce(*delegate); }});
  }
  deliveries_.push_back({own_, [notifyOnce, observer = coordinator->observer] {
                           if (const auto delegate = observer.lock()) notifyOnce(*delegate);
                         }});
}

}  // namespace appsync::test
