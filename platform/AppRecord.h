// What the registry knows of one bundle.
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>

#include "platform/InstallProgress.h"
#include "platform/InstallTypes.h"

namespace appsync::platform {

class AppRecord;

/// One bundle of the registry: an app, a placeholder, or something else that has an identifier (an extension, say).
///
/// A record is a snapshot: it keeps answering as on the day it was taken, whatever happens to the bundle.
/// Threads: any. Nothing fails; what is not known is absent or empty.
class BundleRecord {
 public:
  virtual ~BundleRecord() = default;

  /// The bundle identifier, never empty.
  [[nodiscard]] virtual std::string applicationIdentifier() const = 0;

  /// This record as an app's, or null when it is none.
  [[nodiscard]] virtual const AppRecord* asAppRecord() const { return nullptr; }

  /// For logs.
  [[nodiscard]] virtual std::string description() const = 0;
};

/// One app: installed, or a placeholder whose package is still to come, or both (an installed app that is being updated
/// has a placeholder over it and is reported as installed and as placeholder).
class AppRecord : public BundleRecord {
 public:
  [[nodiscard]] const AppRecord* asAppRecord() const final { return this; }

  /// The same as `applicationIdentifier` unless the bundle's info dictionary says otherwise; may be absent.
  [[nodiscard]] virtual std::optional<std::string> bundleIdentifier() const = 0;
  /// The info dictionary's version text, if any.
  [[nodiscard]] virtual std::optional<std::string> bundleVersion() const = 0;
  /// Device path of the container: the folder that holds the bundle and, beside it, store metadata and artwork.
  [[nodiscard]] virtual std::optional<std::string> bundleContainerPath() const = 0;
  /// Device path of the bundle itself, "…/Name.app".
  [[nodiscard]] virtual std::optional<std::string> bundlePath() const = 0;

  /// `kApplicationTypeUser`, `kApplicationTypeSystem` or another word of the registry's.
  [[nodiscard]] virtual std::string applicationType() const = 0;
  /// Bytes that its bundle takes, as the installer counted them: the installed one's where there are two. What an app
  /// writes while it runs is not in it. Cheap: walks over all apps ask.
  [[nodiscard]] virtual std::uint64_t staticDiskUsage() const = 0;
  /// Why it is, or was last, being installed.
  [[nodiscard]] virtual TSInstallType installType() const = 0;
  /// A package is installed and can be launched.
  [[nodiscard]] virtual bool isInstalled() const = 0;
  /// A package is still to come.
  [[nodiscard]] virtual bool isPlaceholder() const = 0;

  /// Whether its licence data is bound to this device: such an app cannot be used on another one it is restored to.
  [[nodiscard]] virtual bool hasMIDBasedSINF() const = 0;

  /// Live progress of the running install, or null when none runs.
  [[nodiscard]] virtual std::shared_ptr<InstallProgress> installProgress() const = 0;
};

}  // namespace appsync::platform
