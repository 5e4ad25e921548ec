// Holds home screens to platform/HomeScreenService.h.
#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "kit/contracts/Contract.h"
#include "platform/HomeScreenService.h"

namespace appsync::test {

class HomeScreenSubject {
 public:
  virtual ~HomeScreenSubject() = default;

  [[nodiscard]] virtual platform::HomeScreenService& homeScreen() = 0;
  /// Has an icon of that app on the home screen, after those that are there.
  virtual void addApp(std::string_view identifier) = 0;
  /// An icon layout, as a host writes it for this home screen, in which these apps stand in this order; none where
  /// hosts write none.
  [[nodiscard]] virtual std::optional<std::string> layoutOf(const std::vector<std::string>& identifiers) {
    static_cast<void>(identifiers);
    return std::nullopt;
  }
  /// From now on requests for an assertion on the app are denied; false where that cannot be done.
  [[nodiscard]] virtual bool denyAssertions(std::string_view identifier) {
    static_cast<void>(identifier);
    return false;
  }
};

class HomeScreenContract : public Contract<HomeScreenSubject> {};

}  // namespace appsync::test
