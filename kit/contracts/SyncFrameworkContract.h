// Contract of platform/SyncFramework.h.
#pragma once

#include <string>
#include <vector>

#include "kit/contracts/Contract.h"
#include "platform/SyncFramework.h"

namespace appsync::test {

class SyncFrameworkSubject {
 public:
  virtual ~SyncFrameworkSubject() = default;

  /// Its log must record messages of every level.
  [[nodiscard]] virtual platform::SyncFramework& framework() = 0;
  /// Returns the logged lines in order; each contains its message.
  [[nodiscard]] virtual std::vector<std::string> loggedLines() = 0;
};

class SyncFrameworkContract : public Contract<SyncFrameworkSubject> {
 protected:
  [[nodiscard]] platform::SyncFramework& framework() { return subject().framework(); }
};

}  // namespace appsync::test
