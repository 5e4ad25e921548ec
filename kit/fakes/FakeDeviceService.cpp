#include "kit/fakes/FakeDeviceService.h"

#include <string>
#include <utility>

#include "kit/fakes/CallJournal.h"

namespace appsync::test {

namespace {

std::string nameOf(platform::ZTDeviceService::Operation operation) {
  return operation == platform::ZTDeviceService::Operation::prioritizeAsset ? "prioritizeAsset"
                                                                            : "cancelAssetTransferForFailedAsset";
}

}  // namespace

void FakeDeviceService::stopSupporting(Operation operation) {
  const std::scoped_lock lock(mutex_);
  unsupported_.insert(operation);
}

void FakeDeviceService::failPrioritizing(std::optional<Error> error) {
  const std::scoped_lock lock(mutex_);
  failure_ = std::move(error);
}

void FakeDeviceService::holdCompletions() {
  const std::scoped_lock lock(mutex_);
  holdsCompletions_ = true;
}

void FakeDeviceService::complete() {
  std::vector<std::function<void()>> pending;
  {
    const std::scoped_lock lock(mutex_);
    pending.swap(pending_);
  }
  for (const auto& completion : pending)
    completion();
}

bool FakeDeviceService::supports(Operation operation) {
  if (journal_.beforeCall("deviceService.supports", nameOf(operation))) return false;
  const std::scoped_lock lock(mutex_);
  return !unsupported_.contains(operation);
}

void FakeDeviceService::prioritizeAsset(const std::shared_ptr<platform::ZTAsset>& asset, Completion completion) {
  check(Operation::prioritizeAsset, *asset);
  std::optional<Error> error = journal_.beforeCall("deviceService.prioritizeAsset", asset->identifier());
  {
    const std::scoped_lock lock(mutex_);
    if (!error) error = failure_;
    if (holdsCompletions_) {
      pending_.emplace_back([completion = std::move(completion), error = std::move(error)] { completion(error); });
      return;
    }
  }
  completion(error);
}

void FakeDeviceService::cancelAssetTransferForFailedAsset(const std::shared_ptr<platform::ZTAsset>& asset) {
  check(Operation::cancelAssetTransferForFailedAsset, *asset);
  static_cast<void>(journal_.beforeCall("deviceService.cancelAssetTransferForFailedAsset", asset->identifier()));
}

void FakeDeviceService::check(Operation operation, const platform::ZTAsset& asset) {
  if (asset.dataclass() != "Application") misuse("an asset of dataclass " + asset.dataclass());
  const std::scoped_lock lock(mutex_);
  if (unsupported_.contains(operation)) misuse(nameOf(operation) + " is not supported");
}

}  // namespace appsync::test
