// Making a package.
#pragma once

#include <string>
#include <vector>

#include "base/Error.h"

namespace appsync::device {

/// Writes the named items, files and folders with all that is in them, to the package at `package`; each stands in it
/// under its last path component. All are host paths.
///
/// Equal content gives equal bytes: entries are sorted, carry no times and no owners, and of permissions only whether a
/// file may be executed. Memory does not grow with the files. Links and special files, which no device installs, and
/// names that are no UTF-8 are refused. `package` is a place as `writeHostFile` takes it; after a failure it is as it
/// was. Errors: "POSIX", the text says what is wrong with which file.
[[nodiscard]] Status writePackage(const std::vector<std::string>& items, const std::string& package);

}  // namespace appsync::device
