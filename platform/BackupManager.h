// The device's backup service, as far as restoring apps' data goes.
#pragma once

#include <cstdint>
#include <string_view>

#include "base/Error.h"

namespace appsync::platform {

/// A connection to the backup service. Threads: every operation may be called from any thread.
class BackupManager {
 public:
  virtual ~BackupManager() = default;

  /// Whether the restore that is going on still holds data for the app. `size`, which may be null, receives the data's
  /// bytes.
  [[nodiscard]] virtual bool restoreDataExists(std::string_view bundleIdentifier, std::uint64_t* size) = 0;

  /// Gives up restoring the app's data; it is dropped. An app without data is a success. `error` may be null.
  virtual bool cancelApplicationRestore(std::string_view bundleIdentifier, ErrorSlot error) = 0;
};

}  // namespace appsync::platform
