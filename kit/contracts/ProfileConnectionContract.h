// Contract of platform/ProfileConnection.h.
#pragma once

#include "kit/contracts/Contract.h"
#include "platform/ProfileConnection.h"

namespace appsync::test {

class ProfileConnectionSubject {
 public:
  virtual ~ProfileConnectionSubject() = default;

  [[nodiscard]] virtual platform::ProfileConnection& connection() = 0;
  virtual void set(platform::RestrictionSetting setting, platform::RestrictionValue value) = 0;
};

class ProfileConnectionContract : public Contract<ProfileConnectionSubject> {};

}  // namespace appsync::test
