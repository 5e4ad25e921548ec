// The app registry: installed apps, placeholders, and the installer.
#pragma once

#include <functional>
#include <memory>
#include <string_view>
#include <vector>

#include "base/Error.h"
#include "platform/AppRecord.h"
#include "platform/FileLocation.h"
#include "platform/InstallTypes.h"
#include "platform/Keys.h"
#include "plist/PropertyList.h"

namespace appsync::platform {

using AppRecords = std::vector<std::shared_ptr<const AppRecord>>;

/// Receives changes to running installs, on the registry's threads. Callbacks to one observer never overlap. The
/// registry holds no lock during a callback, which may therefore call the registry. Implementing a callback is
/// optional.
class AppRegistryObserver {
 public:
  virtual ~AppRegistryObserver() = default;

  /// Receives the prioritized and the paused installs: once soon after `addObserver`, even if both lists are empty, and
  /// after each change.
  virtual void applicationInstallsArePrioritized(const AppRecords& prioritized, const AppRecords& paused) {
    static_cast<void>(prioritized), static_cast<void>(paused);
  }

  /// Receives installs that were cancelled, by `InstallProgress::cancel` or by the user.
  virtual void applicationInstallsDidCancel(const AppRecords& records) { static_cast<void>(records); }
};

/// Whether a look-up also finds apps that are only placeholders.
enum class PlaceholderLookup { off, on };

/// Thread-safe. Installs run concurrently; the plug-in starts up to ten at a time.
class AppRegistry {
 public:
  virtual ~AppRegistry() = default;

  /// Starts callbacks to `observer`, which the caller owns and which must outlive its registration. Idempotent.
  virtual void addObserver(AppRegistryObserver& observer) = 0;

  /// Stops callbacks to `observer`: blocks until its running callback has returned, unless called from that callback;
  /// no further callback begins. Does nothing if the observer is not registered.
  virtual void removeObserver(AppRegistryObserver& observer) = 0;

  /// Returns true if an app or a placeholder with that identifier exists.
  [[nodiscard]] virtual bool applicationIsInstalled(std::string_view bundleIdentifier) = 0;

  /// Returns the app's record, or null if there is no such app. With `PlaceholderLookup::off`, also null if the app is
  /// only a placeholder.
  [[nodiscard]] virtual std::shared_ptr<const AppRecord> recordForIdentifier(std::string_view bundleIdentifier,
                                                                             PlaceholderLookup placeholders) = 0;

  /// Calls `visit` for each bundle of `kind`, on the calling thread, before it returns, and stops once `visit` sets
  /// `stop`. The order is the same for every enumeration of an unchanged registry. Enumerates a snapshot of the
  /// registry as of the call; `visit` may install and uninstall. Each record is valid only during its visit.
  virtual void enumerateBundlesOfType(BundleKind kind,
                                      const std::function<void(const BundleRecord& bundle, bool& stop)>& visit) = 0;

  /// Installs the package or placeholder at `location`; returns when it is installed or has failed. `options`:
  /// - `PackageTypeKey`: `kPackageTypeCustomer` installs a package and replaces an earlier version and a placeholder of
  ///   the app. `PackageTypePlaceholder` installs an app directory as a placeholder; an installed app with the same
  ///   identifier stays usable until its package is installed.
  /// - `BundleIdentifierKey`: the app, which must match the package.
  /// - `kInstallTypeKey`, `kStoreMetadataKey`, `kLicenceDataKey`: stored with the record. A null value for
  ///   `kStoreMetadataKey` or `kLicenceDataKey` is ignored.
  ///
  /// Reads the location only during the call and never changes it. Atomic: after a failure or a crash the app is
  /// unchanged. Errors: `kInstallerErrorDomain`, or "POSIX" for system errors.
  [[nodiscard]] virtual Status installApplication(const FileLocation& location, const plist::Dictionary& options) = 0;

  /// Removes the app's placeholder or, if it has none, the app with its data. An installed app that also has a
  /// placeholder stays usable with any options: cleaning up after a failed update never removes the app. With
  /// `kUninstallPlaceholdersOnlyKey` true, an app is never removed. Removing an app, but not removing a placeholder,
  /// adds it to the uninstalled-apps list. Fails if the identifier is unknown. Failures and errors are as for
  /// `installApplication`.
  [[nodiscard]] virtual Status uninstallApplication(std::string_view bundleIdentifier,
                                                    const plist::Dictionary& options = {}) = 0;

  /// Returns the progress of the app's running install, in units of `phase`, or null if no install is running.
  [[nodiscard]] virtual std::shared_ptr<InstallProgress> installProgressForApplication(const AppRecord& record,
                                                                                       TSInstallPhase phase) = 0;

  /// Ends the current phase of an install: a loaded package moves on to the installing phase; a load that failed or
  /// finished is no longer shown as running.
  virtual void installPhaseFinishedForProgress(InstallProgress& progress) = 0;
};

}  // namespace appsync::platform
