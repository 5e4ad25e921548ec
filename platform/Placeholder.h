// What stands on the home screen for an app whose package is still to come.
#pragma once

#include <memory>
#include <optional>
#include <string>
#include <utility>

#include "base/Bytes.h"
#include "base/Error.h"
#include "platform/ClientIdentity.h"
#include "platform/InstallOptions.h"
#include "platform/InstallPromise.h"
#include "platform/InstallTypes.h"
#include "plist/PropertyList.h"

namespace appsync::platform {

/// What a placeholder shows of the app to come, beside its name and icon.
class PlaceholderAttributes {
 public:
  PlaceholderAttributes() = default;
  /// Seeded with the app's whole info dictionary, which may be empty.
  [[nodiscard]] static PlaceholderAttributes initWithInfoPlistDictionary(plist::Dictionary info) {
    PlaceholderAttributes attributes;
    attributes.infoDictionary_ = std::move(info);
    return attributes;
  }

  [[nodiscard]] const plist::Dictionary& infoDictionary() const { return infoDictionary_; }

  /// Whether the app may not be opened even when it is installed.
  [[nodiscard]] bool launchProhibited() const { return launchProhibited_; }
  void setLaunchProhibited(bool prohibited) { launchProhibited_ = prohibited; }

  [[nodiscard]] const std::optional<std::string>& bundleVersion() const { return bundleVersion_; }
  void setBundleVersion(std::optional<std::string> version) { bundleVersion_ = std::move(version); }

  /// For logs.
  [[nodiscard]] std::string description() const {
    return "<PlaceholderAttributes version " + bundleVersion_.value_or("(null)") +
           (launchProhibited_ ? ", launch prohibited>" : ">");
  }

 private:
  plist::Dictionary infoDictionary_;
  bool launchProhibited_ = false;
  std::optional<std::string> bundleVersion_;
};

/// Made by `InstallCoordination`, configured by the client that made it, then given to a coordinator with
/// `InstallCoordinator::setPlaceholderPromise`, after which only the coordinator ends it. One that is dropped without
/// having been given away leaves nothing behind.
///
/// The home screen shows it once it is its coordinator's and its configuration is complete; one whose configuration
/// never is complete is not shown, and does not keep the app from being installed.
///
/// Threads: one at a time. Every operation fails, and changes nothing, once the placeholder was cancelled; those that
/// configure it also once its configuration is complete. Errors: `kInstallCoordinationErrorDomain`.
class Placeholder {
 public:
  virtual ~Placeholder() = default;

  [[nodiscard]] virtual std::string bundleName() const = 0;
  [[nodiscard]] virtual std::string bundleID() const = 0;
  [[nodiscard]] virtual TSInstallType installType() const = 0;
  [[nodiscard]] virtual ClientIdentity client() const = 0;

  /// The icon, a PNG picture. Without one the service draws something.
  [[nodiscard]] virtual Status setIconPromise(std::shared_ptr<PromisedTransferToPath> promise) = 0;
  [[nodiscard]] virtual Status setPlaceholderAttributes(const PlaceholderAttributes& attributes) = 0;
  /// None says that there is no store metadata.
  [[nodiscard]] virtual Status setMetadata(const std::optional<StoreMetadata>& metadata) = 0;
  /// The app's licence. The bytes are needed only during the call.
  [[nodiscard]] virtual Status setSinfData(ByteView licence) = 0;
  [[nodiscard]] virtual Status setConfigurationComplete() = 0;

  /// Gives the placeholder up, and its icon promise with it, in the name of the client that made it. One that is a
  /// coordinator's goes with the coordinator only: then this fails.
  virtual Status cancelForReason(const Error& reason, ClientIdentity client) = 0;

  /// For logs.
  [[nodiscard]] virtual std::string description() const = 0;
};

}  // namespace appsync::platform
