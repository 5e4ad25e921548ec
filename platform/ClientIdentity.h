// Clients of the install-coordination service.
#pragma once

#include <cstdint>

namespace appsync::platform {

/// A client of the install-coordination service. A service may define others; the plug-in passes their numbers on.
enum class ClientIdentity : std::uint64_t {
  CXClientBazaarly = 1,  ///< the device's app store
  CXClientUser = 2,      ///< the user of the device
  CXClientSync = 3,      ///< this plug-in
};

}  // namespace appsync::platform
