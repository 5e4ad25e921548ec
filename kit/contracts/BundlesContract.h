// Holds bundle services to platform/Bundle.h.
#pragma once

#include <string>
#include <string_view>

#include "kit/contracts/Contract.h"
#include "platform/Bundle.h"

namespace appsync::test {

class BundlesSubject {
 public:
  virtual ~BundlesSubject() = default;

  [[nodiscard]] virtual platform::Bundles& bundles() = 0;
  /// Device path of a folder that exists and is empty, without a slash at its end.
  [[nodiscard]] virtual std::string folder() = 0;
  /// Puts a file there, and the folders that lead to it.
  virtual void put(std::string_view path, std::string_view contents) = 0;
};

class BundlesContract : public Contract<BundlesSubject> {
 protected:
  /// Opens "App.app" in the test's folder after putting that info dictionary in it.
  [[nodiscard]] std::unique_ptr<platform::Bundle> openWithInfo(std::string_view infoFile) {
    subject().put(subject().folder() + "/App.app/Info.plist", infoFile);
    return subject().bundles().openBundle({subject().folder() + "/App.app", true});
  }
};

}  // namespace appsync::test
