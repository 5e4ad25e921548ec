// Unpacks app packages into containers.
#pragma once

#include <cstdint>
#include <functional>
#include <string>

#include "base/Error.h"
#include "device/packages/BundleInfo.h"
#include "device/packages/PackageReader.h"

namespace appsync::device {

struct UnpackedPackage {
  std::string appFolder;
  BundleInfo info;
  std::uint64_t bytes = 0;  ///< of all files
};

/// Unpacks a package into an open, empty directory, without waiting for the disk. `shouldContinue` receives the
/// fraction done, from 0 to 1, after each entry; if it returns false, unpacking fails with
/// `InstallerFailure::cancelled`. A failure leaves part of the package.
[[nodiscard]] Result<UnpackedPackage> unpackPackage(PackageReader& package, int folder,
                                                    const std::function<bool(double fraction)>& shouldContinue);

}  // namespace appsync::device
