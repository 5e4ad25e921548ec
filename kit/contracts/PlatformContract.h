// Contract of platform/Platform.h.
#pragma once

#include "kit/contracts/Contract.h"
#include "platform/Platform.h"

namespace appsync::test {

class PlatformSubject {
 public:
  virtual ~PlatformSubject() = default;

  [[nodiscard]] virtual platform::Platform& platform() = 0;
};

class PlatformContract : public Contract<PlatformSubject> {};

}  // namespace appsync::test
