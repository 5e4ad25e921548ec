// The registry's enumerations: why an app is being installed, and how far it is.
#pragma once

#include <cstdint>

namespace appsync::platform {

/// Why an app is being installed. Registries report values beyond the named ones too: 8 stands for an app that was
/// demoted on purpose.
enum class TSInstallType : std::uint64_t {
  None = 0,
  StoreDownload = 1,
  Restore = 2,
  AutomaticDownload = 3,
  Sync = 4,
  AutomaticUpdate = 5,
  Migration = 6,
  Downgrade = 7,
  IntentionalDowngrade = 8,
};

/// Where an install stands. The order counts: what is below Canceled can still be cancelled.
enum class TSInstallState : std::uint64_t {
  Waiting = 0,
  Active = 1,
  Paused = 2,
  Canceled = 3,
  Failed = 4,
  Finished = 5,
};

/// What an active install is doing.
enum class TSInstallPhase : std::uint64_t {
  Loading = 0,
  Installing = 1,
  RestoringData = 2,
  InstallingPlaceholder = 3,
};

/// Which bundles a walk of the registry visits.
enum class BundleKind : std::uint32_t {
  /// Every bundle: apps and placeholders, of users and of the system; also bundles that are no apps.
  all = 0,
  /// Every user bundle, installed or placeholder.
  user = 1,
  /// The bundles of system apps, installed or placeholder.
  system = 7,
};

}  // namespace appsync::platform
