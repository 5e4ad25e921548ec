// What the installer refuses, and why.
#pragma once

#include <string>

#include "base/Error.h"
#include "platform/Keys.h"

namespace appsync::device {

/// The codes of errors in platform::kInstallerErrorDomain. Each text says what is wrong and what to do.
enum class InstallerFailure : long {
  badOptions = 1,      ///< the install options lack something or contradict each other
  notAPackage,         ///< not a zip archive, or no app folder where a placeholder should be
  damaged,             ///< cut short, or bytes that do not add up
  encrypted,           ///<
  unsafeEntry,         ///< a name that leads out of the package, a link, a device
  duplicateEntry,      ///< one name twice, or a file where a folder is
  strayEntry,          ///< something beside the app that does not belong there
  noApp,               ///< no "Name.app" folder with an "Info.plist" in it
  severalApps,         ///<
  badInfo,             ///< an "Info.plist" that cannot be read, or without a bundle identifier
  badIdentifier,       ///< an identifier with other characters than letters, digits, '-', '.', '_'
  identifierMismatch,  ///< another app than the one asked for
  tooLarge,            ///< more entries or bytes than a package may have, or bytes packed tighter than any app
  unknownApp,          ///< the registry has no such app
  cancelled,           ///< given up by `InstallProgress::cancel`
};

[[nodiscard]] inline Error installerError(InstallerFailure failure, std::string text) {
  return {std::string(platform::kInstallerErrorDomain), static_cast<long>(failure), std::move(text), nullptr};
}

}  // namespace appsync::device
