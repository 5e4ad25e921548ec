// One app's install, as the install-coordination service carries it out.
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "base/Error.h"
#include "platform/ClientIdentity.h"
#include "platform/InstallObserver.h"
#include "platform/InstallOptions.h"
#include "platform/InstallPromise.h"
#include "platform/Placeholder.h"

namespace appsync::platform {

/// What a coordinator is to do. A service has at most one of each kind for an app, whoever made it.
enum class CoordinatorKind : std::uint8_t {
  any,               ///< in look-ups only: whichever there is
  initiating,        ///< a new app
  updating,          ///< a new version of an installed app, which stays usable until the new one is in
  restoring,         ///< an app that a restored device had
  restoringDemoted,  ///< the same for an app of which it had the icon and data only
};

/// A handle on the service's coordinator. Handles on one coordinator see the same state; dropping them all changes
/// nothing: a coordinator lives in the service, also across restarts, until its app is installed, the install has
/// failed, or it is cancelled. One that restores a demoted app may have ended as soon as its placeholder is shown, if
/// it has no app-asset promise by then; the placeholder stays.
///
/// The service installs the app once the coordinator has its install options (one that restores can do without) and its
/// placeholder promise, its app-asset promise is complete and, where it has a user-data promise, that is complete too.
/// From then on its app-asset promise cannot be taken back. When the install has ended the coordinator is gone, and the
/// observers hear of it.
///
/// Each set operation is atomic and fails, changing nothing, when what it sets was set before, when the promise was
/// cancelled or belongs to another app, or when the coordinator has ended. A promise that could not be set stays the
/// caller's. Errors: `kInstallCoordinationErrorDomain`, or "POSIX" where the system failed. Threads: any.
class InstallCoordinator {
 public:
  virtual ~InstallCoordinator() = default;

  /// The app; none when the service has lost it.
  [[nodiscard]] virtual std::optional<std::string> bundleID() const = 0;
  [[nodiscard]] virtual CoordinatorKind kind() const = 0;
  /// Who made the coordinator. Only that client may drive it.
  [[nodiscard]] virtual ClientIdentity creatorIdentifier() const = 0;
  /// Why it ended, if it ended badly: the reason that it was cancelled for, or what the installer said.
  [[nodiscard]] virtual std::optional<Error> coordinatorError() const = 0;

  /// Reports this coordinator to `observer`, in place of an earlier one, until it ends or the observer has gone. One
  /// that has an observer connection too hears of everything once.
  virtual void setObserver(std::weak_ptr<InstallObserverDelegate> observer) = 0;

  [[nodiscard]] virtual bool hasInstallOptions() const = 0;
  [[nodiscard]] virtual Status setInstallOptions(const InstallOptions& options) = 0;

  /// The on-demand resources that the app needs at its first launch; an empty list says that there are none.
  [[nodiscard]] virtual bool hasInitialODRAssetPromises() const = 0;
  [[nodiscard]] virtual Status setInitialODRAssetPromises(
      const std::vector<std::shared_ptr<InstallPromise>>& promises) = 0;

  /// The package. `appAssetPromise` is null when there is none.
  [[nodiscard]] virtual bool hasAppAssetPromise() const = 0;
  [[nodiscard]] virtual std::shared_ptr<PromisedTransferToPath> appAssetPromise() const = 0;
  [[nodiscard]] virtual Status setAppAssetPromise(std::shared_ptr<PromisedTransferToPath> promise) = 0;

  /// Who is to make and fulfil the app-asset promise: the creator unless another client was named, also when there is
  /// an error because the service cannot tell.
  [[nodiscard]] virtual ClientIdentity appAssetPromiseResponsibleClient(ErrorSlot error) const = 0;
  [[nodiscard]] virtual Status setAppAssetPromiseResponsibleClient(ClientIdentity client) = 0;

  /// The data that a restored app had.
  [[nodiscard]] virtual bool hasUserDataPromise() const = 0;
  [[nodiscard]] virtual Status setUserDataPromise(std::shared_ptr<PromisedOutOfBandTransfer> promise) = 0;

  /// Null is a failure. Once set the placeholder is the coordinator's, and shown if its configuration is complete.
  [[nodiscard]] virtual bool hasPlaceholderPromise() const = 0;
  [[nodiscard]] virtual Status setPlaceholderPromise(std::shared_ptr<Placeholder> placeholder) = 0;

  /// Ends the coordinator with all its promises, its placeholder and, for a complete app-asset promise, the package. An
  /// app that is installed stays as it is. Fails when the coordinator has ended, or is just installing its app.
  virtual Status cancelForReason(const Error& reason, ClientIdentity client) = 0;

  /// For logs.
  [[nodiscard]] virtual std::string description() const = 0;
};

}  // namespace appsync::platform
