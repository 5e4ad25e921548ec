// The plug-in's own errors in the sync framework's domain.
#pragma once

#include <string>

#include "base/Error.h"
#include "platform/SyncFramework.h"

namespace appsync {

/// Why the plug-in gives something up. The values are the codes.
enum class SyncFailure : long {
  preparationFailed = 1,  ///< a coordinated install could not be prepared
  restoreCancelled = 2,   ///< a cancelled restore, reported as a failed transfer
  restoreGivenUp = 29,    ///< a restore's promise is taken back
  installGivenUp = 30,    ///< a promise of an install or an update is taken back
};

[[nodiscard]] inline Error syncError(SyncFailure failure) {
  return {std::string(platform::kZTErrorDomain), static_cast<long>(failure), {}, nullptr};
}

}  // namespace appsync
