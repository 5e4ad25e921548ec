// Packages of the fake registry.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "base/Error.h"
#include "kit/fakes/FakeApp.h"
#include "kit/fakes/FakeFileSystem.h"
#include "platform/FileLocation.h"
#include "plist/PropertyList.h"

namespace appsync::test {

enum class PackageKind { app, placeholder };

struct FakePackage {
  PackageKind kind = PackageKind::app;
  std::optional<std::string> version;  ///< nullopt if the package has none
  std::uint64_t size = 0;              ///< bytes of the package or of a placeholder's info dictionary
};

/// Returns a package with identifier and version. Any other bytes are a package of any app.
[[nodiscard]] Bytes packageOf(std::string_view identifier, std::string_view version);

/// Returns an error of the installer's domain.
[[nodiscard]] Error installerError(std::string text);

/// Returns the app in the install options, or an empty text.
[[nodiscard]] std::string identifierIn(const plist::Dictionary& options);

/// Reads the package or placeholder at `location`. Fails if it is missing, empty, of another app, or not of the kind in
/// the options.
[[nodiscard]] Result<FakePackage> readPackage(FakeFileSystem& files, const platform::FileLocation& location,
                                              const plist::Dictionary& options);

/// Returns the app's state after the package is installed.
void applyPackage(FakeApp& app, const FakePackage& package, const plist::Dictionary& options);

}  // namespace appsync::test
