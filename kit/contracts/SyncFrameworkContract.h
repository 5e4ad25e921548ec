// Holds sync frameworks to platform/SyncFramework.h.
#pragma once

#include <string>
#include <vector>

#include "kit/contracts/Contract.h"
#include "platform/SyncFramework.h"

namespace appsync::test {

class SyncFrameworkSubject {
 public:
  virtual ~SyncFrameworkSubject() = default;

  /// With a log that takes everything.
  [[nodiscard]] virtual platform::SyncFramework& framework() = 0;
  /// What the log took in, in order: each line contains its message.
  [[nodiscard]] virtual std::vector<std::string> loggedLines() = 0;
};

class SyncFrameworkContract : public Contract<SyncFrameworkSubject> {
 protected:
  [[nodiscard]] platform::SyncFramework& framework() { return subject().framework(); }
};

}  // namespace appsync::test
