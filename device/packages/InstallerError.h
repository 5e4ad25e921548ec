// Errors of the installer.
#pragma once

#include <string>

#include "base/Error.h"
#include "platform/Keys.h"

namespace appsync::device {

/// The codes of errors in platform::kInstallerErrorDomain. Each text names the problem and a remedy.
enum class InstallerFailure : long {
  badOptions = 1,      ///< the install options lack something or contradict each other
  notAPackage,         ///< not a zip archive, or no app folder where a placeholder should be
  damaged,             ///< truncated, or with a wrong checksum
  encrypted,           ///< with a password
  unsafeEntry,         ///< a name that leads outside the package, a link or a device
  duplicateEntry,      ///< one name twice, or a file where a folder is
  strayEntry,          ///< an unexpected file next to the app
  noApp,               ///< no "Name.app" folder with an "Info.plist" in it
  severalApps,         ///<
  badInfo,             ///< an invalid "Info.plist", or one without a bundle identifier
  badIdentifier,       ///< not a valid bundle identifier
  identifierMismatch,  ///< the package contains a different app
  tooLarge,            ///< exceeds `PackageLimits`
  unknownApp,          ///< the registry has no such app
  cancelled,           ///< cancelled by `InstallProgress::cancel`
};

[[nodiscard]] inline Error installerError(InstallerFailure failure, std::string text) {
  return {std::string(platform::kInstallerErrorDomain), static_cast<long>(failure), std::move(text), nullptr};
}

}  // namespace appsync::device
