// The home screen's representation of an app whose package is not installed yet.
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

/// Attributes of a placeholder in addition to name and icon. A plain value.
class PlaceholderAttributes {
 public:
  PlaceholderAttributes() = default;
  /// `info` is the app's complete info dictionary; it may be empty.
  [[nodiscard]] static PlaceholderAttributes initWithInfoPlistDictionary(plist::Dictionary info) {
    PlaceholderAttributes attributes;
    attributes.infoDictionary_ = std::move(info);
    return attributes;
  }

  [[nodiscard]] const plist::Dictionary& infoDictionary() const { return infoDictionary_; }

  /// Whether the app must not be launched even after it is installed.
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

/// Created by `InstallCoordination`, configured by its client and passed to
/// `InstallCoordinator::setPlaceholderPromise`. From then on only the coordinator can end it. Destroying one that was
/// never passed on leaves nothing behind.
///
/// The home screen shows the placeholder once it belongs to a coordinator and its configuration is complete. If the
/// configuration is never completed, the placeholder is not shown, but the app is installed nevertheless.
///
/// Not thread-safe. Operations fail and change nothing once the placeholder is cancelled; the set operations also fail
/// once the configuration is complete. Errors: `kInstallCoordinationErrorDomain`.
class Placeholder {
 public:
  virtual ~Placeholder() = default;

  [[nodiscard]] virtual std::string bundleName() const = 0;
  [[nodiscard]] virtual std::string bundleID() const = 0;
  [[nodiscard]] virtual TSInstallType installType() const = 0;
  [[nodiscard]] virtual ClientIdentity client() const = 0;

  /// Sets the promise of the icon, a PNG file. Without it the service shows a default icon.
  [[nodiscard]] virtual Status setIconPromise(std::shared_ptr<PromisedTransferToPath> promise) = 0;
  [[nodiscard]] virtual Status setPlaceholderAttributes(const PlaceholderAttributes& attributes) = 0;
  /// Sets the store metadata; nullopt means that the app has none.
  [[nodiscard]] virtual Status setMetadata(const std::optional<StoreMetadata>& metadata) = 0;
  /// Sets the app's licence; the bytes are needed only during the call.
  [[nodiscard]] virtual Status setSinfData(ByteView licence) = 0;
  [[nodiscard]] virtual Status setConfigurationComplete() = 0;

  /// Cancels the placeholder and its icon promise. `client` is the placeholder's creator. Fails if the placeholder
  /// belongs to a coordinator, which alone can end it.
  virtual Status cancelForReason(const Error& reason, ClientIdentity client) = 0;

  /// For logs.
  [[nodiscard]] virtual std::string description() const = 0;
};

}  // namespace appsync::platform
