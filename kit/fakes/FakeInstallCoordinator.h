// The objects of the fake install-coordination service: coordinators, placeholders and promises.
#pragma once

#include <memory>
#include <string>
#include <utility>

#include "kit/fakes/CoordinationState.h"

namespace appsync::test {

/// Returns the text of a cancellation in journal lines: "ZTError 30 3".
[[nodiscard]] std::string textOf(const Error& reason, platform::ClientIdentity client);

/// Attaches a promise, within a change. Fails if it cannot be attached.
[[nodiscard]] Status attach(std::shared_ptr<FakePromise>& place, platform::InstallPromise* promise);

/// Counts as one held object of the service during its lifetime.
class HeldObject {
 public:
  explicit HeldObject(std::shared_ptr<CoordinationState> state) : state_(std::move(state)) { ++state_->held; }
  ~HeldObject() { --state_->held; }
  HeldObject(const HeldObject&) = delete;
  HeldObject& operator=(const HeldObject&) = delete;

  CoordinationState* operator->() const { return state_.get(); }
  [[nodiscard]] const std::shared_ptr<CoordinationState>& shared() const { return state_; }

 private:
  std::shared_ptr<CoordinationState> state_;
};

/// Described as "<promise com.a-Asset>".
template <class Interface>
class FakeInstallPromise : public Interface {
 public:
  FakeInstallPromise(std::shared_ptr<CoordinationState> state, std::shared_ptr<FakePromise> promise)
      : state_(std::move(state)), promise_(std::move(promise)) {}

  [[nodiscard]] std::string name() const override { return promise_->name; }
  [[nodiscard]] platform::ClientIdentity client() const override { return promise_->client; }
  [[nodiscard]] std::uint64_t diskSpaceNeeded() const override { return promise_->diskSpaceNeeded; }
  [[nodiscard]] double percentComplete() const override;
  void setPercentComplete(double fraction) override;
  [[nodiscard]] bool isComplete() const override;
  void setComplete(bool complete) override;
  Status cancelForReason(const Error& reason, platform::ClientIdentity client) override;
  [[nodiscard]] std::string description() const override { return "<promise " + promise_->name + ">"; }

  [[nodiscard]] const std::shared_ptr<FakePromise>& promise() const { return promise_; }

 protected:
  /// Changes the promise unless it was cancelled or has ended.
  template <class Change>
  void change(const Change& change);

  const HeldObject state_;
  const std::shared_ptr<FakePromise> promise_;
};

class FakePromisedOutOfBandTransfer final : public FakeInstallPromise<platform::PromisedOutOfBandTransfer> {
 public:
  using FakeInstallPromise::FakeInstallPromise;
};

class FakePromisedTransferToPath final : public FakeInstallPromise<platform::PromisedTransferToPath> {
 public:
  using FakeInstallPromise::FakeInstallPromise;
  [[nodiscard]] std::optional<platform::FileLocation> transferPath() const override;
  void setTransferPath(const platform::FileLocation& path) override;
};

/// Described as "<placeholder com.a>".
class FakeAppPlaceholder final : public platform::Placeholder {
 public:
  FakeAppPlaceholder(std::shared_ptr<CoordinationState> state, std::shared_ptr<FakePlaceholder> placeholder)
      : state_(std::move(state)), placeholder_(std::move(placeholder)) {}

  [[nodiscard]] std::string bundleName() const override { return placeholder_->bundleName; }
  [[nodiscard]] std::string bundleID() const override { return placeholder_->identifier; }
  [[nodiscard]] platform::TSInstallType installType() const override { return placeholder_->installType; }
  [[nodiscard]] platform::ClientIdentity client() const override { return placeholder_->client; }
  [[nodiscard]] Status setIconPromise(std::shared_ptr<platform::PromisedTransferToPath> promise) override;
  [[nodiscard]] Status setPlaceholderAttributes(const platform::PlaceholderAttributes& attributes) override;
  [[nodiscard]] Status setMetadata(const std::optional<platform::StoreMetadata>& metadata) override;
  [[nodiscard]] Status setSinfData(ByteView licence) override;
  [[nodiscard]] Status setConfigurationComplete() override;
  Status cancelForReason(const Error& reason, platform::ClientIdentity client) override;
  [[nodiscard]] std::string description() const override { return "<placeholder " + placeholder_->identifier + ">"; }

  [[nodiscard]] const std::shared_ptr<FakePlaceholder>& placeholder() const { return placeholder_; }

 private:
  /// Runs `change` if the placeholder can still be configured.
  template <class Change>
  Status configure(std::string_view operation, std::string_view arguments, const Change& change);

  const HeldObject state_;
  const std::shared_ptr<FakePlaceholder> placeholder_;
};

/// Described as "<initiating coordinator com.a>".
class FakeInstallCoordinator final : public platform::InstallCoordinator {
 public:
  /// A handle of `client`.
  FakeInstallCoordinator(std::shared_ptr<CoordinationState> state, std::shared_ptr<FakeCoordinator> coordinator,
                         platform::ClientIdentity client)
      : state_(std::move(state)), coordinator_(std::move(coordinator)), client_(client) {}

  [[nodiscard]] std::optional<std::string> bundleID() const override;
  [[nodiscard]] platform::CoordinatorKind kind() const override { return coordinator_->kind; }
  [[nodiscard]] platform::ClientIdentity creatorIdentifier() const override;
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
  [[nodiscard]] std::string description() const override;

 private:
  [[nodiscard]] std::optional<Error> begin(std::string_view operation, std::string_view arguments = {}) const;
  template <class Field>
  [[nodiscard]] bool has(std::string_view operation, Field FakeCoordinator::*field) const;
  /// Runs `change` if `field` is not set and the coordinator has not ended.
  template <class Field, class Change>
  Status set(std::string_view operation, Field FakeCoordinator::*field, std::string_view arguments,
             const Change& change);
  /// Fails the test if the handle's client may not call `operation`.
  void checkDriver(std::string_view operation) const;

  const HeldObject state_;
  const std::shared_ptr<FakeCoordinator> coordinator_;
  const platform::ClientIdentity client_;
};

}  // namespace appsync::test
