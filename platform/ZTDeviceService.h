// The sync daemon's control over running transfers.
#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>

#include "base/Error.h"
#include "platform/ZTAsset.h"

namespace appsync::platform {

/// Lets a client reorder and cancel transfers. Assets are matched by identifier, so an asset created for the call is
/// sufficient. Operations on an asset that is not to be transferred have no effect. Thread-safe.
class ZTDeviceService {
 public:
  /// Operations that older daemons may lack.
  enum class Operation : std::uint8_t { prioritizeAsset, cancelAssetTransferForFailedAsset };

  /// Called exactly once, on a thread of the service or before `prioritizeAsset` returns, and before the service is
  /// destroyed; with nullopt on success.
  using Completion = std::function<void(const std::optional<Error>& error)>;

  virtual ~ZTDeviceService() = default;

  /// Returns whether `operation` may be called. The result never changes.
  [[nodiscard]] virtual bool supports(Operation operation) = 0;

  /// Moves this asset's package ahead of all others whose transfer has not begun.
  virtual void prioritizeAsset(const std::shared_ptr<ZTAsset>& asset, Completion completion) = 0;

  /// Cancels the transfer of this asset's package. A transfer in progress fails and is reported to the client as
  /// failed, possibly before this returns.
  virtual void cancelAssetTransferForFailedAsset(const std::shared_ptr<ZTAsset>& asset) = 0;
};

}  // namespace appsync::platform
