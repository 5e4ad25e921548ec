// The platform's own key texts: what stands in info dictionaries, install options and registry records.
#pragma once

#include <string_view>

namespace appsync::platform {

/// Keys of an app's info dictionary ("Info.plist").
inline constexpr std::string_view BundleIdentifierKey = "BundleIdentifier";
inline constexpr std::string_view kBundleVersionKey = "BundleVersion";
inline constexpr std::string_view kBundleDisplayNameKey = "BundleDisplayName";
inline constexpr std::string_view kBundleExecutableKey = "BundleExecutable";
inline constexpr std::string_view kBundleIconFileKey = "BundleIconFile";

/// Install options: what kind of package `AppRegistry::installApplication` is given.
inline constexpr std::string_view PackageTypeKey = "PackageType";
inline constexpr std::string_view kPackageTypeCustomer = "Customer";
inline constexpr std::string_view PackageTypePlaceholder = "Placeholder";

/// Install option: the `TSInstallType` that the app's record is to carry, a number.
inline constexpr std::string_view kInstallTypeKey = "TSInstallType";

/// Install options of restored apps: store metadata and licence data, each as bytes.
inline constexpr std::string_view kStoreMetadataKey = "StoreMetadata";
inline constexpr std::string_view kLicenceDataKey = "LicenceData";

/// Uninstall option: a boolean; when true only a placeholder is removed, never an installed app.
inline constexpr std::string_view kUninstallPlaceholdersOnlyKey = "UninstallPlaceholdersOnly";

/// `AppRecord::applicationType` of apps that users and the system install.
inline constexpr std::string_view kApplicationTypeUser = "User";
inline constexpr std::string_view kApplicationTypeSystem = "System";

/// Error domain of `AppRegistry::installApplication` and `uninstallApplication`.
inline constexpr std::string_view kInstallerErrorDomain = "InstallerError";

}  // namespace appsync::platform
