// Keys and values of info dictionaries, install options and registry records.
#pragma once

#include <string_view>

namespace appsync::platform {

/// Keys of an app's info dictionary ("Info.plist").
inline constexpr std::string_view BundleIdentifierKey = "BundleIdentifier";
inline constexpr std::string_view kBundleVersionKey = "BundleVersion";
inline constexpr std::string_view kBundleDisplayNameKey = "BundleDisplayName";
inline constexpr std::string_view kBundleExecutableKey = "BundleExecutable";
inline constexpr std::string_view kBundleIconFileKey = "BundleIconFile";

/// Install option: the kind of the package.
inline constexpr std::string_view PackageTypeKey = "PackageType";
inline constexpr std::string_view kPackageTypeCustomer = "Customer";
inline constexpr std::string_view PackageTypePlaceholder = "Placeholder";

/// Install option: a number, the `TSInstallType` of the app's record.
inline constexpr std::string_view kInstallTypeKey = "TSInstallType";

/// Install options of restored apps: store metadata and licence as data.
inline constexpr std::string_view kStoreMetadataKey = "StoreMetadata";
inline constexpr std::string_view kLicenceDataKey = "LicenceData";

/// Uninstall option: a boolean; true removes a placeholder only, never an installed app.
inline constexpr std::string_view kUninstallPlaceholdersOnlyKey = "UninstallPlaceholdersOnly";

/// Values of `AppRecord::applicationType` for apps installed by the user and by the system.
inline constexpr std::string_view kApplicationTypeUser = "User";
inline constexpr std::string_view kApplicationTypeSystem = "System";

/// Error domain of `AppRegistry::installApplication` and `uninstallApplication`.
inline constexpr std::string_view kInstallerErrorDomain = "InstallerError";

}  // namespace appsync::platform
