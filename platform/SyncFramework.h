// What the daemon's sync framework offers to its clients.
#pragma once

#include <memory>
#include <optional>
#include <string>
#include <string_view>

#include "base/Error.h"
#include "base/Log.h"
#include "platform/ZTAsset.h"

namespace appsync::platform {

/// The sync framework's error domain.
inline constexpr std::string_view kZTErrorDomain = "ZTError";

/// Threads: every operation may be called from any thread at any time.
class SyncFramework {
 public:
  virtual ~SyncFramework() = default;

  /// The log's category of that number; lives as long as the framework. Cheap: clients call it for every message.
  [[nodiscard]] virtual LogCategory& ZTGetLogCategory(int number) = 0;

  /// Whether the framework expects that what failed with `error` may succeed when it is tried again.
  [[nodiscard]] virtual bool ZTIsRecoverableError(const Error& error) = 0;

  /// A new record of a package that is to come to the device. Never null.
  [[nodiscard]] virtual std::shared_ptr<ZTAsset> downloadAssetWithIdentifier(std::string_view identifier,
                                                                             std::string_view dataclass,
                                                                             std::optional<std::string> prettyName) = 0;
};

}  // namespace appsync::platform
