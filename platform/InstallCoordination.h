// The install-coordination service.
#pragma once

#include <cstdint>
#include <memory>
#include <set>
#include <string_view>

namespace appsync::platform {

/// Who owns a coordinator.
enum class ClientIdentity : std::uint64_t {
  CXClientBazaarly = 1,  ///< the device's app store
  CXClientSync = 3,      ///< this plug-in
};

/// Hears of coordinators, on threads of the service's own.
class InstallObserverDelegate {
 public:
  virtual ~InstallObserverDelegate() = default;
};

/// A connection that reports the coordinators of some clients to a delegate for as long as it lives. When its
/// destructor has returned no callback runs on another thread.
class InstallObserver {
 public:
  virtual ~InstallObserver() = default;
};

/// Threads: any.
class InstallCoordination {
 public:
  virtual ~InstallCoordination() = default;

  /// Whether this device installs through coordinators. Asked once, when the plug-in starts.
  [[nodiscard]] virtual bool coordinationIsEnabled() = 0;

  /// Opens an observer connection under a service name. `delegate` stays the caller's and must outlive the connection.
  [[nodiscard]] virtual std::unique_ptr<InstallObserver> initWithMachServiceName(
      std::string_view serviceName, const std::set<ClientIdentity>& clients, InstallObserverDelegate& delegate) = 0;
};

}  // namespace appsync::platform
