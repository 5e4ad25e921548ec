#include "device/storage/DatabaseError.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <memory>
#include <utility>

#include <sqlite3.h>

#include "device/storage/Database.h"

namespace appsync::device {

namespace {

/// Extended codes add to the primary one above its byte.
long primaryCodeOf(const Error& error) {
  constexpr long kPrimary = 0xFF;
  return error.code & kPrimary;
}

}  // namespace

int systemErrorOf(const Error& error) {
  if (error.domain == domains::kPOSIX) return static_cast<int>(error.code);
  constexpr std::array<std::pair<int, int>, 7> kMeanings{{
      {SQLITE_FULL, ENOSPC},
      {SQLITE_READONLY, EROFS},
      {SQLITE_PERM, EACCES},
      {SQLITE_CANTOPEN, EACCES},
      {SQLITE_NOMEM, ENOMEM},
      {SQLITE_BUSY, EBUSY},
      {SQLITE_LOCKED, EBUSY},
  }};
  const auto found = std::ranges::find(kMeanings, static_cast<int>(primaryCodeOf(error)), &std::pair<int, int>::first);
  return error.domain != kSQLiteDomain || found == kMeanings.end() ? EIO : found->second;
}

Error asSystemError(Error error) {
  if (error.domain != kSQLiteDomain) return error;
  Error system{std::string(domains::kPOSIX), systemErrorOf(error), error.text, nullptr};
  system.underlying = std::make_shared<const Error>(std::move(error));
  return system;
}

Status asSystemError(Status status) {
  return status ? status : asSystemError(std::move(status).error());
}

bool isDatabaseDamage(const Error& error) {
  return error.domain == kSQLiteDomain &&
         (primaryCodeOf(error) == SQLITE_CORRUPT || primaryCodeOf(error) == SQLITE_NOTADB);
}

}  // namespace appsync::device
