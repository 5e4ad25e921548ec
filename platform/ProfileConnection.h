// Restrictions that profiles place on the device.
#pragma once

#include <cstdint>

namespace appsync::platform {

/// The restrictions that sync clients ask for.
enum class RestrictionSetting { appInstallationAllowed, appRemovalAllowed };

/// The effective answer over all profiles.
enum class RestrictionValue : std::uint8_t { unset = 0, yes = 1, no = 2 };

/// Threads: any. The answer may change from one call to the next.
class ProfileConnection {
 public:
  virtual ~ProfileConnection() = default;

  [[nodiscard]] virtual RestrictionValue effectiveBoolValueForSetting(RestrictionSetting setting) = 0;
};

}  // namespace appsync::platform
