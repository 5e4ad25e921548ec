// The files through which host and plug-in meet, and what stands in them.
#pragma once

#include <cstdint>
#include <string_view>

#include "plist/PropertyList.h"

namespace appsync {

/// The one dataclass that this plug-in syncs.
inline constexpr std::string_view kApplicationDataclass = "Application";

/// Where the host puts its instructions for this dataclass, and packages beside it.
inline constexpr std::string_view kPublicStaging = "/var/mobile/Media/PublicStaging";
inline constexpr std::string_view kStagingFolder = "/var/mobile/Media/PublicStaging/ApplicationSync";

/// The plug-in's own folder. In it, the work area: the host's staging folder as it was taken over.
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

/// Files beside an app's bundle, or beside what the host staged for it.
inline constexpr std::string_view kInfoPlistName = "Info.plist";
inline constexpr std::string_view kStoreMetadataName = "HarvoMetadata.plist";
inline constexpr std::string_view kArtworkName = "HarvoArtwork";
/// The icon's file in a placeholder bundle.
inline constexpr std::string_view kPlaceholderIconName = "Icon.png";
/// Info dictionaries, store metadata and pictures of more bytes than this are not read.
inline constexpr std::uint64_t kMaximumMetadataBytes = std::uint64_t{16} << 20;
/// Key of the flag in "Info.plist" that keeps an app from being launched.
inline constexpr std::string_view kLaunchProhibitedKey = "TSApplicationLaunchProhibited";

/// Keys of a todo-list entry, and the words of its "operation".
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

/// Whether `value`, which may be null, may serve as an identifier or a path from the host: a string without "/.." in
/// it.
[[nodiscard]] bool isValidBundleIdentifier(const plist::Value* value);
[[nodiscard]] bool isValidBundleIdentifier(std::string_view text);

}  // namespace appsync
