// Contract of platform/UninstalledAppsList.h.
#pragma once

#include <string_view>

#include "kit/contracts/Contract.h"
#include "platform/UninstalledAppsList.h"

namespace appsync::test {

class UninstalledAppsListSubject {
 public:
  virtual ~UninstalledAppsListSubject() = default;

  /// Initially empty.
  [[nodiscard]] virtual platform::UninstalledAppsList& list() = 0;
  /// Removes an installed app.
  virtual void removeRealApp(std::string_view identifier) = 0;
  /// Installs an app.
  virtual void installApp(std::string_view identifier) = 0;
  /// Makes all later clearing fail. Returns false if not supported.
  [[nodiscard]] virtual bool failClearing() { return false; }
  /// Restarts the list's process. Returns false if not supported.
  [[nodiscard]] virtual bool restart() { return false; }
};

class UninstalledAppsListContract : public Contract<UninstalledAppsListSubject> {};

}  // namespace appsync::test
