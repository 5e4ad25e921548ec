// Holds lists of removed apps to platform/UninstalledAppsList.h.
#pragma once

#include <string_view>

#include "kit/contracts/Contract.h"
#include "platform/UninstalledAppsList.h"

namespace appsync::test {

class UninstalledAppsListSubject {
 public:
  virtual ~UninstalledAppsListSubject() = default;

  /// Empty at first.
  [[nodiscard]] virtual platform::UninstalledAppsList& list() = 0;
  /// Has a real app of that identifier removed.
  virtual void removeRealApp(std::string_view identifier) = 0;
  /// Has an app of that identifier installed.
  virtual void installApp(std::string_view identifier) = 0;
  /// From now on nothing can be cleared; false where that cannot be done.
  [[nodiscard]] virtual bool failClearing() { return false; }
  /// Ends the process that keeps the list and begins another; false where that cannot be done.
  [[nodiscard]] virtual bool restart() { return false; }
};

class UninstalledAppsListContract : public Contract<UninstalledAppsListSubject> {};

}  // namespace appsync::test
