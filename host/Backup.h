// A backup: a directory of this machine with everything that is needed to restore a device's apps, except packages.
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
#include "platform/SyncFiles.h"
#include "plist/PropertyList.h"

namespace appsync::host {

/// Names in the backup's directory, and in the directory of an app, "Apps/<identifier>".
namespace backup_files {
inline constexpr std::string_view kManifest = "Manifest.plist";
inline constexpr std::string_view kApps = "Apps";
inline constexpr std::string_view kStoreMetadata = kStoreMetadataName;
inline constexpr std::string_view kLicence = restore_file::kLicenceKey;
inline constexpr std::string_view kIcon = restore_file::kIconKey;
inline constexpr std::string_view kData = "Data";
}  // namespace backup_files

/// The manifest's entry for an app. Sizes are in bytes; nullopt if the app has no such file.
struct BackedUpApp {
  AppName name;
  /// `Downgrade` or `IntentionalDowngrade` for a demoted app, else `None`.
  platform::TSInstallType demotion = platform::TSInstallType::None;
  std::optional<std::uint64_t> storeMetadata;
  std::optional<std::uint64_t> licence;
  std::optional<std::uint64_t> icon;
  std::optional<std::uint64_t> data;
  /// The number of data items that are not files, directories or links and are not saved. Not in the manifest.
  std::uint64_t leftOut = 0;
  /// Why the entry cannot be used; empty if it can.
  std::string damage;

  [[nodiscard]] bool isDemoted() const { return demotion != platform::TSInstallType::None; }
};

struct Backup {
  std::string path;
  /// Unique to each backup.
  std::string identifier;
  std::vector<BackedUpApp> apps;
  /// Bundle identifiers in the order of the home screen.
  std::vector<std::string> iconOrder;
};

/// Returns the content of the backup's manifest.
[[nodiscard]] plist::Dictionary manifestOf(const Backup& backup);

/// Reads and checks a backup's manifest. Marks entries that cannot be used as damaged. Fails if the directory is not a
/// backup or is one of another version.
[[nodiscard]] Result<Backup> readBackup(const std::string& path);

/// Reads a file of an app. Fails if its size is not `size`, which the manifest gives.
[[nodiscard]] Result<Bytes> readBackupFile(const Backup& backup, const BackedUpApp& app, std::string_view name,
                                           std::uint64_t size);

/// Returns the host path of the app's data directory.
[[nodiscard]] std::string dataFolderIn(const Backup& backup, const BackedUpApp& app);

}  // namespace appsync::host
