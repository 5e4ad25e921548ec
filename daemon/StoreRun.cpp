#include "daemon/StoreRun.h"

#include <cerrno>
#include <chrono>

namespace appsync::daemon {
namespace {

Error packageMissingError(std::string text) {
  return {std::string(domains::kPOSIX), ENOENT, std::move(text), nullptr};
}

}  // namespace

host::IdentifierSet awaitedFromStore(device::Device& device) {
  host::IdentifierSet identifiers;
  const auto awaited = device::StoreClient::awaited(device.services().installCoordination());
  if (!awaited) return identifiers;
  for (const device::CoordinatorSummary& app : *awaited)
    identifiers.insert(app.identifier);
  return identifiers;
}

StoreRun::StoreRun(device::Device& device, const std::vector<host::PlannedApp>& plan, host::SyncProgress& progress,
                   InstallWatcher& watcher, const host::InterruptSignals& interruption)
    : progress_(progress), watcher_(watcher), interruption_(interruption) {
  for (const host::PlannedApp& app : plan) {
    if (app.work == host::PlannedWork::restore) planned_.insert(app.name.identifier);
  }
  if (planned_.empty()) return;
  folder_ = device.services().settings().storeFolder();
  if (folder_) store_ = host::readLibrary(*folder_);
  for (const host::PlannedApp& app : plan) {
    if (app.work != host::PlannedWork::restore) continue;
    const Result<std::string> path = find(app.name.identifier);
    progress_.expect(app.name, path ? (*store_)->packages.find(app.name.identifier)->second.bytes : 0);
  }
  client_ = std::make_unique<device::StoreClient>(
      device.services().installCoordination(), device.services().fileSystem(),
      [this](std::string_view identifier) { return find(identifier); },
      [this](const device::StoreDelivery& delivery) { report(delivery); });
}

void StoreRun::wait() {
  if (client_) client_->wait();
}

Result<std::string> StoreRun::find(std::string_view identifier) const {
  if (!planned_.contains(identifier) || interruption_.requested()) {
    return Error{std::string(domains::kPOSIX), ECANCELED, "the next sync installs its package", nullptr};
  }
  if (!folder_) {
    return packageMissingError(
        "the device has no store for its package; set a folder of packages with `appsync set DEVICE store=FOLDER`");
  }
  if (!*store_) return store_->error();
  const auto found = (*store_)->packages.find(identifier);
  if (found == (*store_)->packages.end()) {
    return packageMissingError("the store " + *folder_ + " has no package of this app; the next sync tries again");
  }
  return found->second.path;
}

void StoreRun::report(const device::StoreDelivery& delivery) {
  if (!planned_.contains(delivery.identifier)) return;
  const host::AppName name = nameOf(delivery);
  if (!delivery.failure) {
    return watcher_.watch(
        {name, host::AppEvent::installed, delivery.path, delivery.bytes, std::chrono::steady_clock::now()});
  }
  const bool isCutOff = interruption_.requested() && delivery.failure->code == ECANCELED;
  progress_.finish({isCutOff ? host::AppEvent::cutOff : host::AppEvent::failed, name, delivery.failure->text});
}

host::AppName StoreRun::nameOf(const device::StoreDelivery& delivery) const {
  if (!delivery.failure && store_ && *store_) {
    const auto found = (*store_)->packages.find(delivery.identifier);
    if (found != (*store_)->packages.end()) return found->second.name;
  }
  return {delivery.identifier, delivery.name, {}};
}

}  // namespace appsync::daemon
