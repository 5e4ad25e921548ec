// The clients' handle of a coordinator.
#pragma once

#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "device/coordination/CoordinatorState.h"
#include "device/coordination/ServiceHandle.h"
#include "platform/InstallCoordinator.h"

namespace appsync::device {

class CoordinatorHandle final : public ServiceHandle<platform::InstallCoordinator, CoordinatorState> {
 public:
  /// `client` is the owner of the handle, which may change the coordinator if it is its creator.
  CoordinatorHandle(std::shared_ptr<Coordinators> coordinators, std::shared_ptr<CoordinatorState> state,
                    platform::ClientIdentity client)
      : ServiceHandle(std::move(coordinators), std::move(state)), client_(client) {}

  [[nodiscard]] std::optional<std::string> bundleID() const override { return state_->identifier; }
  [[nodiscard]] platform::CoordinatorKind kind() const override { return state_->kind; }
  [[nodiscard]] platform::ClientIdentity creatorIdentifier() const override { return state_->creator; }
  [[nodiscard]] std::optional<Error> coordinatorError() const override;
  void setObserver(std::weak_ptr<platform::InstallObserverDelegate> observer) override;
  [[nodiscard]] bool hasInstallOptions() const override;
  [[nodiscard]] Status setInstallOptions(const platform::InstallOptions& options) override;
  [[nodiscard]] bool hasInitialODRAssetPromises() const override;
  [[nodiscard]] Status setInitialODRAssetPromises(
      const std::vector<std::shared_ptr<platform::InstallPromise>>& promises) override;
  [[nodiscard]] bool hasAppAssetPromise() const override;
  [[nodiscard]] std::shared_ptr<platform::PromisedTransferToPath> appAssetPromise() const override;
  [[nodiscard]] Status setAppAssetPromise(std::shared_ptr<platform::PromisedTransferToPath> promise) override;
  [[nodiscard]] platform::ClientIdentity appAssetPromiseResponsibleClient(ErrorSlot error) const override;
  [[nodiscard]] Status setAppAssetPromiseResponsibleClient(platform::ClientIdentity client) override;
  [[nodiscard]] bool hasUserDataPromise() const override;
  [[nodiscard]] Status setUserDataPromise(std::shared_ptr<platform::PromisedOutOfBandTransfer> promise) override;
  [[nodiscard]] bool hasPlaceholderPromise() const override;
  [[nodiscard]] Status setPlaceholderPromise(std::shared_ptr<platform::Placeholder> placeholder) override;
  Status cancelForReason(const Error& reason, platform::ClientIdentity client) override;
  /// "<initiating coordinator com.example.notes of client 3>"
  [[nodiscard]] std::string description() const override;

 private:
  const platform::ClientIdentity client_;
};

/// Returns "initiating", "updating", "restoring", "restoring demoted" or "any".
[[nodiscard]] std::string_view nameOf(platform::CoordinatorKind kind);

}  // namespace appsync::device
