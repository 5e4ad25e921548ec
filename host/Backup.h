// A backup: what a device's apps need to come back, in a folder of this machine.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "base/Bytes.h"
#include "base/Error.h"
#include "host/AppOutcome.h"
#include "platform/InstallTypes.h"
#include "plist/PropertyList.h"

namespace appsync::host {

/// Names in a backup's folder, and in the folder of an app, "Apps/<identifier>".
namespace backup_files {
inline constexpr std::string_view kManifest = "Manifest.plist";
inline constexpr std::string_view kApps = "Apps";
inline constexpr std::string_view kStoreMetadata = "HarvoMetadata.plist";
inline constexpr std::string_view kLicence = "ApplicationSINF";
inline constexpr std::string_view kIcon = "PlaceholderIcon";
inline constexpr std::string_view kData = "Data";
}  // namespace backup_files

/// What the manifest says of an app. Sizes are in bytes; absent is what the app did not have.
struct BackedUpApp {
  AppName app;
  /// `Downgrade` or `IntentionalDowngrade` of a demoted app, else `None`.
  platform::TSInstallType demotion = platform::TSInstallType::None;
  std::optional<std::uint64_t> storeMetadata;
  std::optional<std::uint64_t> licence;
  std::optional<std::uint64_t> icon;
  std::optional<std::uint64_t> data;
  /// How much of its data is neither file, folder nor link, and not in the backup. Not in the manifest.
  std::uint64_t leftOut = 0;
  /// Why the entry cannot be used; empty for one that can.
  std::string damage;

  [[nodiscard]] bool isDemoted() const { return demotion != platform::TSInstallType::None; }
};

struct Backup {
  std::string path;
  /// Different for every backup that is made.
  std::string identifier;
  std::vector<BackedUpApp> apps;
  /// The home screen, from the first place to the last.
  std::vector<std::string> iconOrder;
};

[[nodiscard]] plist::Dictionary manifestOf(const Backup& backup);

/// Reads and checks a backup's manifest. An entry that cannot be used is marked as damaged; what is no backup, or one
/// of a later version, is an error that says so.
[[nodiscard]] Result<Backup> readBackup(const std::string& path);

/// A file of an app, which must be of the size that the manifest gives.
[[nodiscard]] Result<Bytes> readBackupFile(const Backup& backup, const BackedUpApp& app, std::string_view name,
                                           std::uint64_t size);

/// Host path of the app's folder of data.
[[nodiscard]] std::string dataFolderIn(const Backup& backup, const BackedUpApp& app);

}  // namespace appsync::host
