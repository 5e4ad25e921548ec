// Keeping a promise.
#pragma once

#include "platform/InstallPromise.h"

namespace appsync {

/// Everything has been delivered, and people see it.
inline void fulfil(platform::InstallPromise& promise) {
  promise.setPercentComplete(1.0);
  promise.setComplete(true);
}

}  // namespace appsync
