// The clients' handle of a placeholder.
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
  /// Can be set once. If the promise completes after the placeholder is shown, the icon is added then.
  [[nodiscard]] Status setIconPromise(std::shared_ptr<platform::PromisedTransferToPath> promise) override;
  [[nodiscard]] Status setPlaceholderAttributes(const platform::PlaceholderAttributes& attributes) override;
  [[nodiscard]] Status setMetadata(const std::optional<platform::StoreMetadata>& metadata) override;
  [[nodiscard]] Status setSinfData(ByteView licence) override;
  [[nodiscard]] Status setConfigurationComplete() override;
  Status cancelForReason(const Error& reason, platform::ClientIdentity client) override;
  /// "<placeholder com.example.notes>"
  [[nodiscard]] std::string description() const override { return "<placeholder " + state_->identifier + '>'; }
};

/// Returns the state of a placeholder of `coordinators`, or null for null and placeholders of other services.
[[nodiscard]] std::shared_ptr<PlaceholderState> stateOf(const Coordinators& coordinators,
                                                        const std::shared_ptr<platform::Placeholder>& placeholder);

}  // namespace appsync::device
