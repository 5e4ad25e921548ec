// The base of the clients' handles.
#pragma once

#include <memory>
#include <utility>

namespace appsync::device {

class Coordinators;

/// A handle of a state of the service. Several handles may share a state. They may outlive the service; changes then
/// have no effect.
template <class Interface, class State>
class ServiceHandle : public Interface {
 public:
  ServiceHandle(std::shared_ptr<Coordinators> coordinators, std::shared_ptr<State> state)
      : coordinators_(std::move(coordinators)), state_(std::move(state)) {}

  /// Returns the state, or null if it belongs to another service than `coordinators`.
  [[nodiscard]] std::shared_ptr<State> stateIn(const Coordinators& coordinators) const noexcept {
    return coordinators_.get() == &coordinators ? state_ : nullptr;
  }

 protected:
  const std::shared_ptr<Coordinators> coordinators_;
  const std::shared_ptr<State> state_;
};

}  // namespace appsync::device
