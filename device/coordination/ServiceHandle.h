// What clients hold of the install-coordination service.
#pragma once

#include <memory>
#include <utility>

namespace appsync::device {

class Coordinators;

/// A handle on something of the service's. Handles on one thing see the same state; they may outlive the service, and
/// change nothing then.
template <class Interface, class State>
class ServiceHandle : public Interface {
 public:
  ServiceHandle(std::shared_ptr<Coordinators> coordinators, std::shared_ptr<State> state)
      : coordinators_(std::move(coordinators)), state_(std::move(state)) {}

  /// What it is a handle on, if that is in `coordinators`; null for what another service made.
  [[nodiscard]] std::shared_ptr<State> stateIn(const Coordinators& coordinators) const noexcept {
    return coordinators_.get() == &coordinators ? state_ : nullptr;
  }

 protected:
  const std::shared_ptr<Coordinators> coordinators_;
  const std::shared_ptr<State> state_;
};

}  // namespace appsync::device
