// The store's library of owned software.
#pragma once

#include <functional>
#include <optional>

#include "base/Error.h"

namespace appsync::platform {

/// A connection to the store's library. Not thread-safe; different connections may be used concurrently. A connection
/// must not be destroyed before its completion has begun; the completion may destroy it.
class SoftwareLibrary {
 public:
  virtual ~SoftwareLibrary() = default;

  /// Updates the receipts of installed apps asynchronously. Calls `completion` exactly once, on a thread of the library
  /// or before this returns, with the error or nullopt.
  virtual void refreshReceipts(std::function<void(const std::optional<Error>& error)> completion) = 0;
};

}  // namespace appsync::platform
