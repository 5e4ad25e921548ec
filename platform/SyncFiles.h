// Files and keys shared by the host and the plug-in. All paths are device paths.
#pragma once

#include <cstdint>
#include <string_view>

namespace appsync {

/// The only dataclass that the plug-in syncs.
inline constexpr std::string_view kApplicationDataclass = "Application";

/// The host writes packages to the public staging directory and its instructions for this dataclass to a subdirectory.
inline constexpr std::string_view kPublicStaging = "/var/mobile/Media/PublicStaging";
inline constexpr std::string_view kStagingFolder = "/var/mobile/Media/PublicStaging/ApplicationSync";

/// The plug-in's directory, and in it the work area: the host's staging directory, moved there by the plug-in.
inline constexpr std::string_view kSyncFolder = "/var/mobile/Library/ApplicationSync";
inline constexpr std::string_view kWorkArea = "/var/mobile/Library/ApplicationSync/HarvoStuff";

inline constexpr std::string_view kTodoListPath =
    "/var/mobile/Library/ApplicationSync/HarvoStuff/ApplicationsSync.plist";
inline constexpr std::string_view kTodoListDebugPath =
    "/var/mobile/Library/ApplicationSync/HarvoStuff/ApplicationsSync.plist-debug.plist";
inline constexpr std::string_view kIconLayoutPath =
    "/var/mobile/Library/ApplicationSync/HarvoStuff/SolvaryIconState.plist";
inline constexpr std::string_view kLastSyncStatePath = "/var/mobile/Library/ApplicationSync/LastSyncAppState.plist";
inline constexpr std::string_view kAssetSortOrderPath = "/var/mobile/Library/ApplicationSync/AssetSortOrder.plist";
inline constexpr std::string_view kIconScratchFolder = "/var/mobile/Library/ApplicationSync/Icons";

/// What the host left on a restored device: a dictionary of bundle identifiers.
inline constexpr std::string_view kRestoreApplicationsPath = "/var/mobile/Media/HarvoRestore/RestoreApplications.plist";

/// The backup service's list of demoted apps: a dictionary of two arrays of bundle identifiers.
inline constexpr std::string_view kDemotedAppsPath =
    "/var/mobile/Library/Preferences/com.corvel.Vaultory.DemotedApps.plist";

/// Key of the installed-assets report: an array of { `platform::BundleIdentifierKey`: identifier }.
inline constexpr std::string_view kDeletedKey = "_Deleted";

/// Names of files next to an app's bundle, or among the files that the host staged for it.
inline constexpr std::string_view kInfoPlistName = "Info.plist";
inline constexpr std::string_view kStoreMetadataName = "HarvoMetadata.plist";
inline constexpr std::string_view kArtworkName = "HarvoArtwork";
/// The icon's file in a placeholder bundle.
inline constexpr std::string_view kPlaceholderIconName = "Icon.png";
/// Info dictionaries, store metadata and pictures of more bytes than this are not read.
inline constexpr std::uint64_t kMaximumMetadataBytes = std::uint64_t{16} << 20;
/// Key of the flag in "Info.plist" that keeps an app from being launched.
inline constexpr std::string_view kLaunchProhibitedKey = "TSApplicationLaunchProhibited";

/// Keys of a todo-list entry, and values of its "operation".
namespace todo {
inline constexpr std::string_view kIdentifier = "identifier";
inline constexpr std::string_view kOperation = "operation";
inline constexpr std::string_view kVersion = "version";
inline constexpr std::string_view kName = "name";

inline constexpr std::string_view kInstall = "install";
inline constexpr std::string_view kRemove = "remove";
inline constexpr std::string_view kSent = "SENT";
inline constexpr std::string_view kDownloaded = "DOWNLOADED";
inline constexpr std::string_view kInstalled = "INSTALLED";
inline constexpr std::string_view kFailed = "FAILED";
}  // namespace todo

/// Keys of an app's entry in the restore file, each with data.
namespace restore_file {
inline constexpr std::string_view kMetadataKey = "HarvoMetadata";
inline constexpr std::string_view kLicenceKey = "ApplicationSINF";
inline constexpr std::string_view kIconKey = "PlaceholderIcon";
}  // namespace restore_file

/// Keys of the demoted-apps file.
namespace demoted_apps {
inline constexpr std::string_view kAutomaticKey = "AutomaticDowngrades";
inline constexpr std::string_view kIntentionalKey = "IntentionalDowngrades";
}  // namespace demoted_apps

}  // namespace appsync
