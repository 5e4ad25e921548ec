// Holds home screens to platform/HomeScreenService.h.
#pragma once

#include <string_view>

#include "kit/contracts/Contract.h"
#include "platform/HomeScreenService.h"

namespace appsync::test {

class HomeScreenSubject {
 public:
  virtual ~HomeScreenSubject() = default;

  [[nodiscard]] virtual platform::HomeScreenService& homeScreen() = 0;
  /// Has an icon of that app on the home screen, after those that are there.
  virtual void addApp(std::string_view identifier) = 0;
  /// From now on requests for an assertion on the app are denied; false where that cannot be done.
  [[nodiscard]] virtual bool denyAssertions(std::string_view identifier) {
    static_cast<void>(identifier);
    return false;
  }
};

class HomeScreenContract : public Contract<HomeScreenSubject> {};

}  // namespace appsync::test
