// The packages that a sync still has to send, in the order in which they are wanted.
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

/// The client says what is to be sent; somebody on the device may want an app first, or not at all. Both can be asked
/// for before the client has said anything. Threads: any, and one that sends.
class TransferQueue final : public platform::ZTDeviceService {
 public:
  /// What is to be sent, but for what was cancelled already.
  void fill(const platform::Assets& assets);

  /// The package whose turn comes next; null when all have gone. It may be another one a moment later.
  [[nodiscard]] std::shared_ptr<platform::ZTAsset> front() const;
  /// The same, and it is the sender's now.
  [[nodiscard]] std::shared_ptr<platform::ZTAsset> take();

  /// Whether the app was cancelled, be its package sent, under way or still to come.
  [[nodiscard]] bool wasCancelled(std::string_view identifier) const;

  [[nodiscard]] bool supports(Operation operation) override;
  /// Fails when all packages are known and this is none of those that are still to be sent.
  void prioritizeAsset(const std::shared_ptr<platform::ZTAsset>& asset, Completion completion) override;
  void cancelAssetTransferForFailedAsset(const std::shared_ptr<platform::ZTAsset>& asset) override;

 private:
  bool moveToFront(std::string_view identifier);

  mutable std::mutex mutex_;
  // Under mutex_:
  std::deque<std::shared_ptr<platform::ZTAsset>> waiting_;
  std::vector<std::string> wantedEarly_;  // in front of `fill`, the latest last
  host::IdentifierSet cancelled_;
  bool isFilled_ = false;
};

}  // namespace appsync::daemon
