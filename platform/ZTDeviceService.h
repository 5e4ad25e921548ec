// The sync daemon's service for the device it runs on.
#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>

#include "base/Error.h"
#include "platform/ZTAsset.h"

namespace appsync::platform {

/// What a client asks of the transfers that the daemon has under way. Assets are matched by their identifier; one made
/// for the call will do, and asking for one that is not to be transferred does nothing.
///
/// Threads: every operation may be called from any thread at any time.
class ZTDeviceService {
 public:
  /// Daemons of some ages lack one or both.
  enum class Operation : std::uint8_t { prioritizeAsset, cancelAssetTransferForFailedAsset };

  /// Called once, on a thread of the service's or before `prioritizeAsset` returns, at the latest before the service
  /// ends; without an error when it was done.
  using Completion = std::function<void(const std::optional<Error>& error)>;

  virtual ~ZTDeviceService() = default;

  /// To be asked before one of them is called. The answer does not change.
  [[nodiscard]] virtual bool supports(Operation operation) = 0;

  /// Sends this asset's package before all others whose turn has not come.
  virtual void prioritizeAsset(const std::shared_ptr<ZTAsset>& asset, Completion completion) = 0;

  /// Stops sending a package. A transfer that was under way ends as a failed one, reported as such to the client,
  /// perhaps before this returns.
  virtual void cancelAssetTransferForFailedAsset(const std::shared_ptr<ZTAsset>& asset) = 0;
};

}  // namespace appsync::platform
