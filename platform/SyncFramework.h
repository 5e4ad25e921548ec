// The daemon's sync framework.
#pragma once

#include <memory>
#include <optional>
#include <string>
#include <string_view>

#include "base/Error.h"
#include "base/Log.h"
#include "platform/ZTAsset.h"

namespace appsync::platform {

inline constexpr std::string_view kZTErrorDomain = "ZTError";

/// Thread-safe. No operation fails.
class SyncFramework {
 public:
  virtual ~SyncFramework() = default;

  /// Returns log category `number`, which lives as long as the framework. Must be cheap: called for every message.
  [[nodiscard]] virtual LogCategory& ZTGetLogCategory(int number) = 0;

  /// Returns true if an operation that failed with `error` may succeed when retried.
  [[nodiscard]] virtual bool ZTIsRecoverableError(const Error& error) = 0;

  /// Returns a new asset for a package to be sent to the device. Never null.
  [[nodiscard]] virtual std::shared_ptr<ZTAsset> downloadAssetWithIdentifier(std::string_view identifier,
                                                                             std::string_view dataclass,
                                                                             std::optional<std::string> prettyName) = 0;
};

}  // namespace appsync::platform
