// The install-coordination service.
#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <set>
#include <string>
#include <string_view>

#include "base/Error.h"
#include "platform/ClientIdentity.h"
#include "platform/FileLocation.h"
#include "platform/InstallCoordinator.h"
#include "platform/InstallObserver.h"
#include "platform/InstallPromise.h"
#include "platform/InstallTypes.h"
#include "platform/Placeholder.h"
#include "plist/PropertyList.h"

namespace appsync::platform {

/// The service's error domain. Code 1 is reserved for user-presentable errors; the service defines the other codes.
inline constexpr std::string_view kInstallCoordinationErrorDomain = "InstallCoordinationError";

/// Whether a look-up creates a missing coordinator.
enum class IfMissing : std::uint8_t { findNothing, create };

/// Whether the user must confirm the removal of an app.
enum class UserConfirmation : std::uint8_t { skip, ask };

/// Installs, updates and removes apps on behalf of several clients, which identify themselves. Thread-safe; operations
/// may also be called from callbacks.
class InstallCoordination {
 public:
  using UninstallCompletion = std::function<void(const std::optional<Error>& error)>;

  virtual ~InstallCoordination() = default;

  /// Returns whether this device installs through coordinators. The plug-in reads it once, at its start; if false, the
  /// only other operation that it calls is `initWithMachServiceName`.
  [[nodiscard]] virtual bool coordinationIsEnabled() = 0;

  /// Returns the app's coordinator of `kind`, regardless of its creator; with `IfMissing::create`, creates a missing
  /// one for `client`. `CoordinatorKind::any` never creates one and prefers coordinators of `client` over others, and
  /// older ones over newer ones. Returns null if there is none. `error`, which may be null, is set only if the
  /// operation failed, not if nothing was found. `created`, which may be null, is set if a coordinator is returned.
  [[nodiscard]] virtual std::shared_ptr<InstallCoordinator> coordinatorForApp(CoordinatorKind kind,
                                                                              std::string_view bundleIdentifier,
                                                                              ClientIdentity client,
                                                                              IfMissing ifMissing, bool* created,
                                                                              ErrorSlot error) = 0;

  /// Creates a placeholder of `client` that belongs to no coordinator. `bundleName` may be empty. Returns null on
  /// failure.
  [[nodiscard]] virtual std::shared_ptr<Placeholder> initAppPlaceholder(std::string_view bundleName,
                                                                        std::string_view bundleIdentifier,
                                                                        TSInstallType installType,
                                                                        ClientIdentity client) = 0;

  /// Create a promise of `client` that is not attached yet. `diskSpaceNeeded` is in bytes, 0 if unknown. Return null on
  /// failure.
  [[nodiscard]] virtual std::shared_ptr<PromisedTransferToPath> makePromisedTransferToPath(
      std::string_view name, ClientIdentity client, const std::optional<FileLocation>& transferPath,
      std::uint64_t diskSpaceNeeded) = 0;
  [[nodiscard]] virtual std::shared_ptr<PromisedOutOfBandTransfer> makePromisedOutOfBandTransfer(
      std::string_view name, ClientIdentity client, std::uint64_t diskSpaceNeeded) = 0;

  /// Removes an app asynchronously. First cancels all coordinators of the app, regardless of their creators, as
  /// `CXClientUser`. Calls `completion` exactly once, on a thread of the service, before the service is destroyed, with
  /// nullopt if the app was removed. Removing an installed app adds it to the uninstalled-apps list.
  virtual void uninstallApp(std::string_view bundleIdentifier, UserConfirmation confirmation,
                            UninstallCompletion completion) = 0;

  /// Returns an error of the service's domain that can be shown to the user, with `underlying` as its underlying error.
  /// `information` may be empty.
  [[nodiscard]] virtual Error createUserPresentableError(long code, const plist::Dictionary& information,
                                                         const Error& underlying) = 0;

  /// Opens a connection that reports the coordinators created by `clients`, and no others, to `delegate`. The caller
  /// owns `delegate`, which must outlive the connection. Returns null on failure.
  [[nodiscard]] virtual std::unique_ptr<InstallObserver> initWithMachServiceName(
      std::string_view serviceName, const std::set<ClientIdentity>& clients, InstallObserverDelegate& delegate) = 0;
};

}  // namespace appsync::platform
