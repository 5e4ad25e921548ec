// The sync daemon's device service.
#pragma once

#include <cstddef>
#include <functional>
#include <mutex>
#include <optional>
#include <set>
#include <vector>

#include "kit/fakes/CallJournal.h"
#include "platform/ZTDeviceService.h"

namespace appsync::test {

/// Initially supports all operations. Journal lines: "deviceService.supports prioritizeAsset",
/// "deviceService.prioritizeAsset com.a", "deviceService.cancelAssetTransferForFailedAsset com.a". Fails the test
/// if it receives an unsupported call or an asset of another dataclass.
class FakeDeviceService final : public platform::ZTDeviceService {
 public:
  explicit FakeDeviceService(CallJournal& journal) : journal_(journal) {}
  /// Calls all pending completions.
  ~FakeDeviceService() override { complete(); }
  FakeDeviceService(const FakeDeviceService&) = delete;
  FakeDeviceService& operator=(const FakeDeviceService&) = delete;

  void stopSupporting(Operation operation);
  /// Sets the error of all later completions; nullopt means success.
  void failPrioritizing(std::optional<Error> error);
  /// Delays all later completions until `complete`.
  void holdCompletions();
  /// Calls the pending completions on the calling thread.
  void complete();

  [[nodiscard]] bool supports(Operation operation) override;
  void prioritizeAsset(const std::shared_ptr<platform::ZTAsset>& asset, Completion completion) override;
  void cancelAssetTransferForFailedAsset(const std::shared_ptr<platform::ZTAsset>& asset) override;

 private:
  void check(Operation operation, const platform::ZTAsset& asset);

  CallJournal& journal_;
  std::mutex mutex_;
  std::set<Operation> unsupported_;
  std::optional<Error> failure_;
  bool holdsCompletions_ = false;
  std::vector<std::function<void()>> pending_;
};

}  // namespace appsync::test
