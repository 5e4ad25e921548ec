// The packages that a sync still has to send, by priority.
#pragma once

#include <deque>
#include <memory>
#include <mutex>
#include <string>
#include <string_view>
#include <vector>

#include "host/HostState.h"
#include "platform/ZTClient.h"
#include "platform/ZTDeviceService.h"

namespace appsync::daemon {

/// The client determines the packages. The user of the device may prioritise or cancel an app at any time, also before
/// `fill`. Thread-safe, with a single thread that takes packages.
class TransferQueue final : public platform::ZTDeviceService {
 public:
  /// Adds the assets, except those that were cancelled already, and applies earlier priorities.
  void fill(const platform::Assets& assets);

  /// Returns the next package, or null if the queue is empty. Another thread may change the order at any time.
  [[nodiscard]] std::shared_ptr<platform::ZTAsset> front() const;
  /// Removes the next package from the queue and returns it, or null if the queue is empty.
  [[nodiscard]] std::shared_ptr<platform::ZTAsset> take();

  /// Returns whether the app was cancelled, before, during or after its transfer.
  [[nodiscard]] bool wasCancelled(std::string_view identifier) const;

  [[nodiscard]] bool supports(Operation operation) override;
  /// Completes with an error if the queue was filled and does not contain the app.
  void prioritizeAsset(const std::shared_ptr<platform::ZTAsset>& asset, Completion completion) override;
  void cancelAssetTransferForFailedAsset(const std::shared_ptr<platform::ZTAsset>& asset) override;

 private:
  bool moveToFront(std::string_view identifier);

  mutable std::mutex mutex_;
  // Guarded by mutex_:
  std::deque<std::shared_ptr<platform::ZTAsset>> waiting_;
  std::vector<std::string> prioritizedBeforeFill_;  // before `fill`, the latest last
  host::IdentifierSet cancelled_;
  bool isFilled_ = false;
};

}  // namespace appsync::daemon
