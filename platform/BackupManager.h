// The part of the device's backup service that restores apps' data.
#pragma once

#include <cstdint>
#include <string_view>

#include "base/Error.h"

namespace appsync::platform {

/// A connection to the backup service. Thread-safe.
class BackupManager {
 public:
  virtual ~BackupManager() = default;

  /// Returns true if the running restore still holds data for the app. `size`, which may be null, then receives the
  /// number of bytes.
  [[nodiscard]] virtual bool restoreDataExists(std::string_view bundleIdentifier, std::uint64_t* size) = 0;

  /// Cancels the restore of the app's data and deletes the data. Succeeds if there is no data. Returns false and sets
  /// `error`, which may be null, if the data could not be deleted.
  virtual bool cancelApplicationRestore(std::string_view bundleIdentifier, ErrorSlot error) = 0;
};

}  // namespace appsync::platform
