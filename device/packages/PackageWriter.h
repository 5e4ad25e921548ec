// Writes packages.
#pragma once

#include <string>
#include <vector>

#include "base/Error.h"

namespace appsync::device {

/// Writes files and whole folders to the package at `package`, each under its last path component. All paths are host
/// paths.
///
/// Equal content gives equal packages: entries are sorted and have no times, owners or permissions except whether a
/// file is executable. Memory use does not depend on the files' sizes. Links, special files and names that are not
/// UTF-8 are rejected, as no device installs them. `package` is a path for `writeHostFile`; a failure leaves the file
/// unchanged. Errors: "POSIX", with a text that names the file.
[[nodiscard]] Status writePackage(const std::vector<std::string>& items, const std::string& package);

}  // namespace appsync::device
