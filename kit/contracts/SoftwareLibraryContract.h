// Holds store libraries to platform/SoftwareLibrary.h.
#pragma once

#include <memory>

#include "kit/contracts/Contract.h"
#include "platform/SoftwareLibrary.h"

namespace appsync::test {

class SoftwareLibrarySubject {
 public:
  virtual ~SoftwareLibrarySubject() = default;

  [[nodiscard]] virtual std::unique_ptr<platform::SoftwareLibrary> makeLibrary() = 0;
  /// From now on refreshes fail; false where that cannot be done.
  [[nodiscard]] virtual bool failRefreshes() { return false; }
};

class SoftwareLibraryContract : public Contract<SoftwareLibrarySubject> {};

}  // namespace appsync::test
