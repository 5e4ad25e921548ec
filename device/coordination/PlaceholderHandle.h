// The placeholder of an app, as the client that made it holds it.
#pragma once

#include <memory>
#include <string>

#include "device/coordination/CoordinatorState.h"
#include "device/coordination/ServiceHandle.h"
#include "platform/Placeholder.h"

namespace appsync::device {

class PlaceholderHandle final : public ServiceHandle<platform::Placeholder, PlaceholderState> {
 public:
  using ServiceHandle::ServiceHandle;

  [[nodiscard]] std::string bundleName() const override { return state_->bundleName; }
  [[nodiscard]] std::string bundleID() const override { return state_->identifier; }
  [[nodiscard]] platform::TSInstallType installType() const override { return state_->installType; }
  [[nodiscard]] platform::ClientIdentity client() const override { return state_->client; }
  /// Can be set once. An icon that comes later than the placeholder is shown is added when its promise completes.
  [[nodiscard]] Status setIconPromise(std::shared_ptr<platform::PromisedTransferToPath> promise) override;
  [[nodiscard]] Status setPlaceholderAttributes(const platform::PlaceholderAttributes& attributes) override;
  [[nodiscard]] Status setMetadata(const std::optional<platform::StoreMetadata>& metadata) override;
  [[nodiscard]] Status setSinfData(ByteView licence) override;
  [[nodiscard]] Status setConfigurationComplete() override;
  Status cancelForReason(const Error& reason, platform::ClientIdentity client) override;
  /// "<placeholder com.example.notes>"
  [[nodiscard]] std::string description() const override { return "<placeholder " + state_->identifier + '>'; }
};

/// The state behind a placeholder that `coordinators` made; null for every other.
[[nodiscard]] std::shared_ptr<PlaceholderState> stateOf(const Coordinators& coordinators,
                                                        const std::shared_ptr<platform::Placeholder>& placeholder);

}  // namespace appsync::device
