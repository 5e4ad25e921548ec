// The apps that reports are about.
#pragma once

#include "platform/AppRegistry.h"

namespace appsync {

/// Calls `visit` with the record of each app that a walk over user bundles meets, in its order. Bundles that are no
/// apps are passed over.
template <class Visit>
void visitUserApps(platform::AppRegistry& registry, const Visit& visit) {
  registry.enumerateBundlesOfType(platform::BundleKind::user, [&visit](const platform::BundleRecord& bundle, bool&) {
    if (const platform::AppRecord* app = bundle.asAppRecord()) visit(*app);
  });
}

}  // namespace appsync
