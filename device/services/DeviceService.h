// The sync daemon's service, as whoever plays the daemon on this device offers it.
#pragma once

#include <memory>
#include <mutex>

#include "platform/ZTDeviceService.h"

namespace appsync::device {

/// Passes what clients ask on to the daemon of the sync that is under way; without one nothing is supported.
/// Threads: any.
class DeviceService final : public platform::ZTDeviceService {
 public:
  /// From now on `daemon` is asked, until the next call; null ends it. When this returns no call to an earlier one runs
  /// on another thread. `daemon` stays the caller's.
  void connect(platform::ZTDeviceService* daemon);

  [[nodiscard]] bool supports(Operation operation) override;
  void prioritizeAsset(const std::shared_ptr<platform::ZTAsset>& asset, Completion completion) override;
  void cancelAssetTransferForFailedAsset(const std::shared_ptr<platform::ZTAsset>& asset) override;

 private:
  std::recursive_mutex mutex_;
  platform::ZTDeviceService* daemon_ = nullptr;
};

}  // namespace appsync::device
