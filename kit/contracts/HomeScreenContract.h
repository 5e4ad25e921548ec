// Contract of platform/HomeScreenService.h.
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
  /// Adds an icon of the app after the existing ones.
  virtual void addApp(std::string_view identifier) = 0;
  /// Returns an icon layout in the host's format with these apps in this order, or nullopt if not supported.
  [[nodiscard]] virtual std::optional<std::string> layoutOf(const std::vector<std::string>& identifiers) {
    static_cast<void>(identifiers);
    return std::nullopt;
  }
  /// Makes the home screen deny assertions on the app. Returns false if not supported.
  [[nodiscard]] virtual bool denyAssertions(std::string_view identifier) {
    static_cast<void>(identifier);
    return false;
  }
};

class HomeScreenContract : public Contract<HomeScreenSubject> {};

}  // namespace appsync::test
