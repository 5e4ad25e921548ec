// Contract of platform/SoftwareLibrary.h.
#pragma once

#include <memory>

#include "kit/contracts/Contract.h"
#include "platform/SoftwareLibrary.h"

namespace appsync::test {

class SoftwareLibrarySubject {
 public:
  virtual ~SoftwareLibrarySubject() = default;

  [[nodiscard]] virtual std::unique_ptr<platform::SoftwareLibrary> makeLibrary() = 0;
  /// Makes all later refreshes fail. Returns false if not supported.
  [[nodiscard]] virtual bool failRefreshes() { return false; }
};

class SoftwareLibraryContract : public Contract<SoftwareLibrarySubject> {};

}  // namespace appsync::test
