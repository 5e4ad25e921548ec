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

/// The domain of the service's own errors. Code 1 is a user-presentable error's; a service numbers the others.
inline constexpr std::string_view kInstallCoordinationErrorDomain = "InstallCoordinationError";

/// What a look-up of a coordinator does when there is none.
enum class IfMissing : std::uint8_t { findNothing, create };

/// Whether the person is asked before an app goes.
enum class UserConfirmation : std::uint8_t { skip, ask };

/// Installs, updates and removes apps for several clients, each of which says who it is.
///
/// Threads: every operation may be called from any thread at any time, from callbacks too.
class InstallCoordination {
 public:
  using UninstallCompletion = std::function<void(const std::optional<Error>& error)>;

  virtual ~InstallCoordination() = default;

  /// Whether this device installs through coordinators. Asked once, when the plug-in starts; where the answer is no, a
  /// connection is all that it asks for besides.
  [[nodiscard]] virtual bool coordinationIsEnabled() = 0;

  /// The app's coordinator of a kind, whichever client made it, or a new one made by `client`. With
  /// `CoordinatorKind::any`, which creates nothing, one that `client` made comes before others', the oldest first. Null
  /// when there is none, with an error unless that is only because there is none to find. `created` may be null; it is
  /// set when a coordinator is returned.
  [[nodiscard]] virtual std::shared_ptr<InstallCoordinator> coordinatorForApp(CoordinatorKind kind,
                                                                              std::string_view bundleIdentifier,
                                                                              ClientIdentity client,
                                                                              IfMissing ifMissing, bool* created,
                                                                              ErrorSlot error) = 0;

  /// A placeholder of `client` that is nobody's yet; null when it cannot be made. `bundleName` may be empty.
  [[nodiscard]] virtual std::shared_ptr<Placeholder> initAppPlaceholder(std::string_view bundleName,
                                                                        std::string_view bundleIdentifier,
                                                                        TSInstallType installType,
                                                                        ClientIdentity client) = 0;

  /// Promises of `client` that are attached to nothing; null when one cannot be made.
  [[nodiscard]] virtual std::shared_ptr<PromisedTransferToPath> makePromisedTransferToPath(
      std::string_view name, ClientIdentity client, const std::optional<FileLocation>& transferPath,
      std::uint64_t diskSpaceNeeded) = 0;
  [[nodiscard]] virtual std::shared_ptr<PromisedOutOfBandTransfer> makePromisedOutOfBandTransfer(
      std::string_view name, ClientIdentity client, std::uint64_t diskSpaceNeeded) = 0;

  /// Removes an app and returns at once. Coordinators of the app are cancelled first, whoever made them, in the name of
  /// `CXClientUser`. `completion` is called exactly once, on a thread of the service's, at the latest before the
  /// service ends; without an error when the app is gone. A real app that is removed joins the uninstalled-apps list.
  virtual void uninstallApp(std::string_view bundleIdentifier, UserConfirmation confirmation,
                            UninstallCompletion completion) = 0;

  /// An error of the service's domain with that code, which a person can be shown; `underlying` says what went wrong,
  /// and becomes its underlying error. `information` may be empty.
  [[nodiscard]] virtual Error createUserPresentableError(long code, const plist::Dictionary& information,
                                                         const Error& underlying) = 0;

  /// Opens a connection, under a service name, that reports to `delegate` the coordinators which `clients` made, and
  /// those only. `delegate` stays the caller's and must outlive the connection; null when it cannot be opened.
  [[nodiscard]] virtual std::unique_ptr<InstallObserver> initWithMachServiceName(
      std::string_view serviceName, const std::set<ClientIdentity>& clients, InstallObserverDelegate& delegate) = 0;
};

}  // namespace appsync::platform
