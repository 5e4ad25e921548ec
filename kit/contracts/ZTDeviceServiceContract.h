// Contract of platform/ZTDeviceService.h.
#pragma once

#include <memory>
#include <string_view>

#include "kit/contracts/Contract.h"
#include "platform/ZTDeviceService.h"

namespace appsync::test {

class ZTDeviceServiceSubject {
 public:
  virtual ~ZTDeviceServiceSubject() = default;

  /// Must have no transfers.
  [[nodiscard]] virtual platform::ZTDeviceService& service() = 0;
};

class ZTDeviceServiceContract : public Contract<ZTDeviceServiceSubject> {
 protected:
  using Operation = platform::ZTDeviceService::Operation;

  [[nodiscard]] platform::ZTDeviceService& service() { return subject().service(); }
  [[nodiscard]] static std::shared_ptr<platform::ZTAsset> asset(std::string_view identifier);
};

}  // namespace appsync::test
