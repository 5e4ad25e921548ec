// The device's register of apps: what is installed, what is being installed, and the installer itself.
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

/// Hears of changes to running installs, on threads of the registry's own. Callbacks to one observer never overlap, and
/// none is made with a lock of the registry held: a callback may call the registry. Each is optional.
class AppRegistryObserver {
 public:
  virtual ~AppRegistryObserver() = default;

  /// Which installs run first and which are paused: once soon after `addObserver`, whatever there is to report, and
  /// then after each change.
  virtual void applicationInstallsArePrioritized(const AppRecords& prioritized, const AppRecords& paused) {
    static_cast<void>(prioritized), static_cast<void>(paused);
  }

  /// These installs were cancelled, by `InstallProgress::cancel` or by the user.
  virtual void applicationInstallsDidCancel(const AppRecords& records) { static_cast<void>(records); }
};

/// Whether a look-up finds placeholders too, or installed apps only.
enum class PlaceholderLookup { off, on };

/// Threads: every operation may be called from any thread at any time, ten installs at once included.
class AppRegistry {
 public:
  virtual ~AppRegistry() = default;

  /// Starts reporting to `observer`, which stays the caller's and must outlive its registration. Adding it twice is as
  /// adding it once.
  virtual void addObserver(AppRegistryObserver& observer) = 0;

  /// Ends it. When this returns no callback to `observer` runs on another thread and none will begin; on a callback's
  /// own thread it returns at once. Removing what was never added does nothing.
  virtual void removeObserver(AppRegistryObserver& observer) = 0;

  /// True when an app or a placeholder with that identifier exists.
  [[nodiscard]] virtual bool applicationIsInstalled(std::string_view bundleIdentifier) = 0;

  /// The app's record, or null. With `PlaceholderLookup::off` an app that is a placeholder only is not found.
  [[nodiscard]] virtual std::shared_ptr<const AppRecord> recordForIdentifier(std::string_view bundleIdentifier,
                                                                             PlaceholderLookup placeholders) = 0;

  /// Calls `visit` for each bundle of a kind, in an order that does not change between two walks of an unchanged
  /// registry, on the calling thread, before it returns; ends early once `visit` sets `stop`. The walk sees the
  /// registry as it was when it began: `visit` may install and uninstall. A record is good during its visit.
  virtual void enumerateBundlesOfType(BundleKind kind,
                                      const std::function<void(const BundleRecord& bundle, bool& stop)>& visit) = 0;

  /// Installs what is at `location` and returns when it is done or has failed.
  ///
  /// A package (`PackageTypeKey` is `kPackageTypeCustomer`) becomes an installed app, in place of an earlier version of
  /// it; a placeholder (`PackageTypePlaceholder`, `location` is an app folder) becomes a placeholder, and leaves an
  /// installed app of that identifier whole and usable until its package comes. `BundleIdentifierKey` names the app and
  /// must agree with what is installed; `kInstallTypeKey`, `kStoreMetadataKey` and `kLicenceDataKey` are kept with the
  /// record; a null under one of these two is as none.
  ///
  /// The location is read, never changed, and needed only during the call. Atomic: after a failure, or a crash at any
  /// moment, the app is as it was before. Errors: `kInstallerErrorDomain`, or "POSIX" where the system failed.
  [[nodiscard]] virtual Status installApplication(const FileLocation& location, const plist::Dictionary& options) = 0;

  /// Removes the placeholder or, if there is none, the app with its data. An installed app under a placeholder stays
  /// whole and usable, whatever the options: removing what a failed update leaves never removes the app. With
  /// `kUninstallPlaceholdersOnlyKey` true an app is never removed. Removing a real app, and nothing else, adds it to
  /// the uninstalled-apps list. An unknown identifier fails.
  [[nodiscard]] virtual Status uninstallApplication(std::string_view bundleIdentifier,
                                                    const plist::Dictionary& options = {}) = 0;

  /// The progress of the app's running install, in that phase's units, or null when none runs.
  [[nodiscard]] virtual std::shared_ptr<InstallProgress> installProgressForApplication(const AppRecord& record,
                                                                                       TSInstallPhase phase) = 0;

  /// Tells that the current phase of an install is over: a loaded package goes on to be installed, a failed or finished
  /// load is no longer shown as running.
  virtual void installPhaseFinishedForProgress(InstallProgress& progress) = 0;
};

}  // namespace appsync::platform
