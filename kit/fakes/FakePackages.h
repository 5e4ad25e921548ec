// Packages as the fake registry understands them.
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
  std::optional<std::string> version;  ///< none when the package does not tell
  std::uint64_t size = 0;              ///< of the package, or of a placeholder's info dictionary, in bytes
};

/// The bytes of a package that tells its identifier and version. (Any other bytes are a package of any app.)
[[nodiscard]] Bytes packageOf(std::string_view identifier, std::string_view version);

/// An error of the installer's own domain.
[[nodiscard]] Error installerError(std::string text);

/// The app that install options name; empty when they name none.
[[nodiscard]] std::string identifierIn(const plist::Dictionary& options);

/// Reads what is to be installed; fails as an installer would when it is not there, empty, another app's, or of a kind
/// that the options do not name.
[[nodiscard]] Result<FakePackage> readPackage(FakeFileSystem& files, const platform::FileLocation& location,
                                              const plist::Dictionary& options);

/// What the app's record becomes when the package has been installed.
void applyPackage(FakeApp& app, const FakePackage& package, const plist::Dictionary& options);

}  // namespace appsync::test
