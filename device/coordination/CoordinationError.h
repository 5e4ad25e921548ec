// Errors of install coordination.
#pragma once

#include <string>
#include <utility>

#include "base/Error.h"
#include "platform/InstallCoordination.h"

namespace appsync::device {

/// The codes of errors in platform::kInstallCoordinationErrorDomain, except 1, the code of user-presentable errors.
enum class CoordinationFailure : long {
  off = 2,          ///< coordination is off on this device
  closed,           ///< the service has ended
  badIdentifier,    ///< not a valid bundle identifier
  noCoordinator,    ///< the app has no coordinator
  ended,            ///< the coordinator, placeholder or promise has ended
  installing,       ///< the app is being installed
  setBefore,        ///< the value can be set only once
  notUsable,        ///< a promise or placeholder that is null, in use, for another app or of another service
  foreignClient,    ///< the operation is reserved for another client
  noPackage,        ///< the app-asset promise was completed without a path
  cancelledByUser,  ///< the reason of `InstallCoordination::cancelByUser`
  appRemoved,       ///< the reason when an app is uninstalled
};

[[nodiscard]] inline Error coordinationError(CoordinationFailure failure, std::string text) {
  return {std::string(platform::kInstallCoordinationErrorDomain), static_cast<long>(failure), std::move(text), nullptr};
}

}  // namespace appsync::device
