// The install of one app through the install-coordination service.
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

/// The purpose of a coordinator. An app has at most one coordinator of each kind, regardless of their creators.
enum class CoordinatorKind : std::uint8_t {
  any,               ///< for look-ups only
  initiating,        ///< a new app
  updating,          ///< a new version of an installed app, which stays usable until then
  restoring,         ///< an app of a restored device
  restoringDemoted,  ///< an app that was demoted to icon and data on that device
};

/// A handle to a coordinator of the service. All handles to one coordinator share its state. The coordinator does not
/// depend on its handles: it exists, also across restarts, until the app is installed, the install fails, or it is
/// cancelled. A coordinator that restores a demoted app may end as soon as its placeholder is shown if it has no
/// app-asset promise by then; the placeholder remains.
///
/// The service installs the app once the coordinator has install options (optional for the restoring kinds), a
/// placeholder promise and a complete app-asset promise, and its user-data promise, if any, is complete. From then on,
/// the app-asset promise cannot be cancelled. The coordinator ends with the install, and its observers are notified.
///
/// Each set operation is atomic. It fails and changes nothing if the value was already set, if the promise was
/// cancelled or belongs to another app, or if the coordinator has ended. After a failure the caller still owns the
/// promise. Errors: `kInstallCoordinationErrorDomain`, or "POSIX" for system errors. Thread-safe.
class InstallCoordinator {
 public:
  virtual ~InstallCoordinator() = default;

  /// Returns the app's bundle identifier, or nullopt if the service no longer has it.
  [[nodiscard]] virtual std::optional<std::string> bundleID() const = 0;
  [[nodiscard]] virtual CoordinatorKind kind() const = 0;
  /// The client that created the coordinator. Only this client may change it, except that the responsible client sets
  /// the app-asset promise and any client may cancel.
  [[nodiscard]] virtual ClientIdentity creatorIdentifier() const = 0;
  /// Returns the reason for the cancellation or the installer's error, or nullopt if neither occurred.
  [[nodiscard]] virtual std::optional<Error> coordinatorError() const = 0;

  /// Reports this coordinator to `observer`, replacing an earlier observer, until the coordinator ends or the observer
  /// is destroyed. An observer that also has an `InstallObserver` connection receives each callback once.
  virtual void setObserver(std::weak_ptr<InstallObserverDelegate> observer) = 0;

  [[nodiscard]] virtual bool hasInstallOptions() const = 0;
  [[nodiscard]] virtual Status setInstallOptions(const InstallOptions& options) = 0;

  /// The on-demand resources that the app needs at its first launch. An empty list means that it needs none.
  [[nodiscard]] virtual bool hasInitialODRAssetPromises() const = 0;
  [[nodiscard]] virtual Status setInitialODRAssetPromises(
      const std::vector<std::shared_ptr<InstallPromise>>& promises) = 0;

  /// The promise of the package. `appAssetPromise` returns null if it is not set.
  [[nodiscard]] virtual bool hasAppAssetPromise() const = 0;
  [[nodiscard]] virtual std::shared_ptr<PromisedTransferToPath> appAssetPromise() const = 0;
  [[nodiscard]] virtual Status setAppAssetPromise(std::shared_ptr<PromisedTransferToPath> promise) = 0;

  /// The client that creates and fulfils the app-asset promise: the coordinator's creator unless another one was set.
  /// If the service cannot determine it, returns the creator and sets `error`, which may be null.
  [[nodiscard]] virtual ClientIdentity appAssetPromiseResponsibleClient(ErrorSlot error) const = 0;
  [[nodiscard]] virtual Status setAppAssetPromiseResponsibleClient(ClientIdentity client) = 0;

  /// The promise of a restored app's data.
  [[nodiscard]] virtual bool hasUserDataPromise() const = 0;
  [[nodiscard]] virtual Status setUserDataPromise(std::shared_ptr<PromisedOutOfBandTransfer> promise) = 0;

  /// The placeholder, which belongs to the coordinator once set and is shown when its configuration is complete.
  /// Setting null fails. `setPlaceholderPromise` sends no report on the calling thread, because
  /// clients hold the queue on which they process reports.
  [[nodiscard]] virtual bool hasPlaceholderPromise() const = 0;
  [[nodiscard]] virtual Status setPlaceholderPromise(std::shared_ptr<Placeholder> placeholder) = 0;

  /// Cancels the coordinator, its promises and its placeholder, and deletes the package of a complete app-asset
  /// promise. An installed app is unchanged. Fails if the coordinator has ended or is installing the app.
  virtual Status cancelForReason(const Error& reason, ClientIdentity client) = 0;

  /// For logs.
  [[nodiscard]] virtual std::string description() const = 0;
};

}  // namespace appsync::platform
