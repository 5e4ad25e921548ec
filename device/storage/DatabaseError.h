// What a failure of the database means for the system.
#pragma once

#include "base/Error.h"

namespace appsync::device {

/// The error number that says the same as an error of the database, or of the system; EIO for all that none says.
[[nodiscard]] int systemErrorOf(const Error& error);

/// An error of the database as one of the system, with the former as its underlying error; any other unchanged.
[[nodiscard]] Error asSystemError(Error error);
[[nodiscard]] Status asSystemError(Status status);

/// Whether the error says that the file is damaged, or not a database.
[[nodiscard]] bool isDatabaseDamage(const Error& error);

}  // namespace appsync::device
