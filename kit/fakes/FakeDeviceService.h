// The sync daemon's service for its device.
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

/// Supports everything at first. Journal lines: "deviceService.supports prioritizeAsset",
/// "deviceService.prioritizeAsset com.a", "deviceService.cancelAssetTransferForFailedAsset com.a". Fails the test when
/// it is asked for what it does not support or about an asset that does not come as an app.
class FakeDeviceService final : public platform::ZTDeviceService {
 public:
  explicit FakeDeviceService(CallJournal& journal) : journal_(journal) {}
  /// Completes what still waits for it.
  ~FakeDeviceService() override { complete(); }
  FakeDeviceService(const FakeDeviceService&) = delete;
  FakeDeviceService& operator=(const FakeDeviceService&) = delete;

  void stopSupporting(Operation operation);
  /// From now on prioritising ends with this error; none ends that.
  void failPrioritizing(std::optional<Error> error);
  /// From now on completions wait for `complete`.
  void holdCompletions();
  /// Calls, on the calling thread, the completions that wait.
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
