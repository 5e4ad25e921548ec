// Holds install-coordination services to platform/InstallCoordination.h.
#pragma once

#include "platform/InstallCoordination.h"
#include "tests/contracts/Contract.h"

namespace appsync::test {

class InstallCoordinationSubject {
 public:
  virtual ~InstallCoordinationSubject() = default;

  [[nodiscard]] virtual platform::InstallCoordination& coordination() = 0;
};

class InstallCoordinationContract : public Contract<InstallCoordinationSubject> {
 protected:
  platform::InstallObserverDelegate delegate;
};

}  // namespace appsync::test
