#include "device/services/DeviceService.h"

#include <utility>

#include "platform/SyncFramework.h"

namespace appsync::device {

void DeviceService::connect(platform::ZTDeviceService* daemon) {
  const std::lock_guard lock(mutex_);
  daemon_ = daemon;
}

bool DeviceService::supports(Operation operation) {
  const std::lock_guard lock(mutex_);
  return daemon_ != nullptr && daemon_->supports(operation);
}

void DeviceService::prioritizeAsset(const std::shared_ptr<platform::ZTAsset>& asset, Completion completion) {
  const std::lock_guard lock(mutex_);
  if (daemon_ != nullptr) return daemon_->prioritizeAsset(asset, std::move(completion));
  completion(Error{std::string(platform::kZTErrorDomain), 0, "no sync is under way", nullptr});
}

void DeviceService::cancelAssetTransferForFailedAsset(const std::shared_ptr<platform::ZTAsset>& asset) {
  const std::lock_guard lock(mutex_);
  if (daemon_ != nullptr) daemon_->cancelAssetTransferForFailedAsset(asset);
}

}  // namespace appsync::device
