// Records of the app registry.
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>

#include "platform/InstallProgress.h"
#include "platform/InstallTypes.h"

namespace appsync::platform {

class AppRecord;

/// One bundle of the registry: an app, a placeholder, or another bundle with an identifier, such as an extension.
///
/// A record is a snapshot: later changes to the bundle do not change it. Thread-safe. No operation fails; unknown
/// values are nullopt or empty.
class BundleRecord {
 public:
  virtual ~BundleRecord() = default;

  /// The bundle identifier, never empty.
  [[nodiscard]] virtual std::string applicationIdentifier() const = 0;

  /// Returns this record if the bundle is an app or a placeholder, else null.
  [[nodiscard]] virtual const AppRecord* asAppRecord() const { return nullptr; }

  /// For logs.
  [[nodiscard]] virtual std::string description() const = 0;
};

/// One app: installed, a placeholder whose package is not installed yet, or both: an installed app that is being
/// updated has a placeholder as well.
class AppRecord : public BundleRecord {
 public:
  [[nodiscard]] const AppRecord* asAppRecord() const final { return this; }

  /// The identifier in the info dictionary; usually equal to `applicationIdentifier`.
  [[nodiscard]] virtual std::optional<std::string> bundleIdentifier() const = 0;
  /// The version in the info dictionary.
  [[nodiscard]] virtual std::optional<std::string> bundleVersion() const = 0;
  /// Device path of the container: the directory of the bundle, its store metadata and its artwork.
  [[nodiscard]] virtual std::optional<std::string> bundleContainerPath() const = 0;
  /// Device path of the bundle, "…/Name.app".
  [[nodiscard]] virtual std::optional<std::string> bundlePath() const = 0;

  /// `kApplicationTypeUser`, `kApplicationTypeSystem` or another type that the registry defines.
  [[nodiscard]] virtual std::string applicationType() const = 0;
  /// Bytes of the bundle as the installer counted them; of the installed bundle if there is a placeholder too. Excludes
  /// data that the app writes. Must be cheap: it is read for every app of an enumeration.
  [[nodiscard]] virtual std::uint64_t staticDiskUsage() const = 0;
  /// The reason for the running install, or else for the last one.
  [[nodiscard]] virtual TSInstallType installType() const = 0;
  /// Returns true if a package is installed and can be launched.
  [[nodiscard]] virtual bool isInstalled() const = 0;
  /// Returns true if a package is yet to be installed.
  [[nodiscard]] virtual bool isPlaceholder() const = 0;

  /// Returns true if the licence data is bound to this device. Such an app cannot be used after a restore to another
  /// one.
  [[nodiscard]] virtual bool hasMIDBasedSINF() const = 0;

  /// Returns the live progress of the running install, or null if no install is running.
  [[nodiscard]] virtual std::shared_ptr<InstallProgress> installProgress() const = 0;
};

}  // namespace appsync::platform
