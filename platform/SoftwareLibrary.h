// The store's library of owned software.
#pragma once

#include <functional>
#include <optional>

#include "base/Error.h"

namespace appsync::platform {

/// A connection to the store's library. Threads: any, one at a time for each connection. Destroying it after the
/// completion has begun is allowed, also on the completion's thread.
class SoftwareLibrary {
 public:
  virtual ~SoftwareLibrary() = default;

  /// Brings the receipts of installed apps up to date. Returns at once; `completion` runs exactly once, on a thread of
  /// the library's own or before this returns, with the error if there was one.
  virtual void refreshReceipts(std::function<void(const std::optional<Error>& error)> completion) = 0;
};

}  // namespace appsync::platform
