// The sync daemon's service for its device.
#pragma once

#include "platform/ZTDeviceService.h"
#include "tests/support/CallJournal.h"

namespace appsync::test {

class FakeDeviceService final : public platform::ZTDeviceService {
 public:
  explicit FakeDeviceService(CallJournal& journal) : journal_(journal) {}

  [[nodiscard]] bool supports(Operation) override { return false; }
  void prioritizeAsset(const std::shared_ptr<platform::ZTAsset>&, Completion completion) override {
    completion(std::nullopt);
  }
  void cancelAssetTransferForFailedAsset(const std::shared_ptr<platform::ZTAsset>& asset) override {
    static_cast<void>(journal_.beforeCall("deviceService.cancelAssetTransferForFailedAsset", asset->identifier()));
  }

 private:
  CallJournal& journal_;
};

}  // namespace appsync::test
