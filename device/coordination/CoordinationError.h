// What install coordination refuses, and why.
#pragma once

#include <string>
#include <utility>

#include "base/Error.h"
#include "platform/InstallCoordination.h"

namespace appsync::device {

/// The codes of errors in platform::kInstallCoordinationErrorDomain but for 1, a user-presentable error's.
enum class CoordinationFailure : long {
  off = 2,          ///< this device installs directly
  closed,           ///< the service has ended
  badIdentifier,    ///< an identifier that no app can have
  noCoordinator,    ///< there is none to do it to
  ended,            ///< the coordinator, placeholder or promise is over
  installing,       ///< too late: the app is being installed
  setBefore,        ///< it can be set once only
  notUsable,        ///< a promise or placeholder that is somebody else's, for another app, or null
  foreignClient,    ///< only the client that made it may do that
  noPackage,        ///< the app-asset promise is complete and has no path
  cancelledByUser,  ///< the reason of `InstallCoordination::cancelByUser`
  appRemoved,       ///< the reason when an app is uninstalled
};

[[nodiscard]] inline Error coordinationError(CoordinationFailure failure, std::string text) {
  return {std::string(platform::kInstallCoordinationErrorDomain), static_cast<long>(failure), std::move(text), nullptr};
}

}  // namespace appsync::device
