// The clients' handles of promises.
#pragma once

#include <memory>
#include <string>

#include "device/coordination/CoordinatorState.h"
#include "device/coordination/Coordinators.h"
#include "device/coordination/ServiceHandle.h"
#include "platform/InstallPromise.h"

namespace appsync::device {

template <class Interface>
class PromiseHandle : public ServiceHandle<Interface, PromiseState> {
  using Handle = ServiceHandle<Interface, PromiseState>;

 public:
  using Handle::Handle;

  [[nodiscard]] std::string name() const override { return state_->name; }
  [[nodiscard]] platform::ClientIdentity client() const override { return state_->client; }
  [[nodiscard]] std::uint64_t diskSpaceNeeded() const override { return state_->diskSpaceNeeded; }
  [[nodiscard]] double percentComplete() const override {
    return coordinators_->read([this] { return state_->fraction; });
  }
  void setPercentComplete(double fraction) override { coordinators_->setFraction(state_, fraction); }
  [[nodiscard]] bool isComplete() const override {
    return coordinators_->read([this] { return state_->isComplete; });
  }
  void setComplete(bool complete) override {
    if (complete) coordinators_->fulfil(state_);
  }
  Status cancelForReason(const Error&, platform::ClientIdentity client) override {
    return coordinators_->withdraw(state_, client);
  }
  /// "<promise com.example.notes-Asset 0.5>"
  [[nodiscard]] std::string description() const override { return coordinators_->describe(*state_); }

 protected:
  using Handle::coordinators_;
  using Handle::state_;
};

class TransferToPathPromise final : public PromiseHandle<platform::PromisedTransferToPath> {
 public:
  using PromiseHandle::PromiseHandle;
  [[nodiscard]] std::optional<platform::FileLocation> transferPath() const override {
    return coordinators_->read([this] { return state_->transferPath; });
  }
  void setTransferPath(const platform::FileLocation& path) override { coordinators_->setTransferPath(state_, path); }
};

class OutOfBandPromise final : public PromiseHandle<platform::PromisedOutOfBandTransfer> {
 public:
  using PromiseHandle::PromiseHandle;
};

/// Returns the state of a promise of `coordinators`, or null for null and promises of other services.
[[nodiscard]] std::shared_ptr<PromiseState> stateOf(const Coordinators& coordinators,
                                                    const std::shared_ptr<platform::InstallPromise>& promise);

}  // namespace appsync::device
