// The registry's enumerations.
#pragma once

#include <cstdint>

namespace appsync::platform {

/// The reason for an install. A registry may report other values too.
enum class TSInstallType : std::uint64_t {
  None = 0,
  StoreDownload = 1,
  Restore = 2,
  AutomaticDownload = 3,
  Sync = 4,
  AutomaticUpdate = 5,
  Migration = 6,
  Downgrade = 7,
  IntentionalDowngrade = 8,  ///< the user demoted the app
};

/// The state of an install. Values below Canceled are those that can be cancelled.
enum class TSInstallState : std::uint64_t {
  Waiting = 0,
  Active = 1,
  Paused = 2,
  Canceled = 3,
  Failed = 4,
  Finished = 5,
};

/// The phase of an active install.
enum class TSInstallPhase : std::uint64_t {
  Loading = 0,
  Installing = 1,
  RestoringData = 2,
  InstallingPlaceholder = 3,
};

/// The bundles that an enumeration visits.
enum class BundleKind : std::uint32_t {
  /// Every bundle: user and system apps, installed or placeholder, and bundles that are not apps.
  all = 0,
  /// Every user bundle, installed or placeholder.
  user = 1,
  /// The bundles of system apps, installed or placeholder.
  system = 7,
};

}  // namespace appsync::platform
