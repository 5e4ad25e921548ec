// Contract of platform/Bundle.h.
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
  /// Device path of an existing, empty directory, without a trailing slash.
  [[nodiscard]] virtual std::string folder() = 0;
  /// Creates a file and its missing parent directories.
  virtual void put(std::string_view path, std::string_view contents) = 0;
};

class BundlesContract : public Contract<BundlesSubject> {
 protected:
  /// Writes the file "App.app/Info.plist" into the test's directory and opens that bundle.
  [[nodiscard]] std::unique_ptr<platform::Bundle> openWithInfo(std::string_view infoFile) {
    subject().put(subject().folder() + "/App.app/Info.plist", infoFile);
    return subject().bundles().openBundle({subject().folder() + "/App.app", true});
  }
};

}  // namespace appsync::test
