// Restrictions that configuration profiles impose on the device.
#pragma once

#include <cstdint>

namespace appsync::platform {

/// The settings that sync clients read.
enum class RestrictionSetting { appInstallationAllowed, appRemovalAllowed };

/// The effective value over all profiles; `unset` if no profile sets it.
enum class RestrictionValue : std::uint8_t { unset = 0, yes = 1, no = 2 };

/// Thread-safe. Values may change between calls. No operation fails.
class ProfileConnection {
 public:
  virtual ~ProfileConnection() = default;

  [[nodiscard]] virtual RestrictionValue effectiveBoolValueForSetting(RestrictionSetting setting) = 0;
};

}  // namespace appsync::platform
