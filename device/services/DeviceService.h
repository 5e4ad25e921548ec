// The sync daemon's service for its clients.
#pragma once

#include <memory>
#include <mutex>

#include "platform/ZTDeviceService.h"

namespace appsync::device {

/// Forwards requests to the daemon of the running sync; supports nothing while none runs. Thread-safe.
class DeviceService final : public platform::ZTDeviceService {
 public:
  /// Forwards requests to `daemon`, or to none if it is null, and blocks until calls of the previous daemon have
  /// returned. Does not take ownership.
  void connect(platform::ZTDeviceService* daemon);

  [[nodiscard]] bool supports(Operation operation) override;
  void prioritizeAsset(const std::shared_ptr<platform::ZTAsset>& asset, Completion completion) override;
  void cancelAssetTransferForFailedAsset(const std::shared_ptr<platform::ZTAsset>& asset) override;

 private:
  std::recursive_mutex mutex_;
  platform::ZTDeviceService* daemon_ = nullptr;
};

}  // namespace appsync::device
