// Who asks the install-coordination service for something.
#pragma once

#include <cstdint>

namespace appsync::platform {

/// A client of the install-coordination service. Services know others too; their numbers are passed on as they are.
enum class ClientIdentity : std::uint64_t {
  CXClientBazaarly = 1,  ///< the device's app store
  CXClientUser = 2,      ///< the person who holds the device
  CXClientSync = 3,      ///< this plug-in
};

}  // namespace appsync::platform
