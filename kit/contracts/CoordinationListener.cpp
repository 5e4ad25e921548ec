#include "kit/contracts/CoordinationListener.h"

#include <algorithm>

#include <gtest/gtest.h>

#include "platform/InstallCoordinator.h"

namespace appsync::test {

using platform::InstallCoordinator;

namespace {

std::string nameOf(InstallCoordinator& coordinator) {
  return coordinator.bundleID().value_or("(none)");
}

std::string errorOf(InstallCoordinator& coordinator) {
  return coordinator.coordinatorError() ? " with error" : "";
}

}  // namespace

std::vector<std::string> CoordinationListener::events() {
  const std::scoped_lock lock(mutex_);
  return events_;
}

std::size_t CoordinationListener::count(const std::string& line) {
  const std::vector<std::string> lines = events();
  return static_cast<std::size_t>(std::ranges::count(lines, line));
}

void CoordinationListener::coordinatorDidInstallPlaceholder(InstallCoordinator& coordinator) {
  note("placeholder " + nameOf(coordinator) + errorOf(coordinator), coordinator);
}

void CoordinationListener::coordinatorDidCompleteSuccessfully(InstallCoordinator& coordinator) {
  note("complete " + nameOf(coordinator) + errorOf(coordinator), coordinator);
}

void CoordinationListener::coordinatorShouldPrioritize(InstallCoordinator& coordinator) {
  note("prioritize " + nameOf(coordinator), coordinator);
}

void CoordinationListener::coordinatorCanceledWithReason(InstallCoordinator& coordinator, const Error& reason,
                                                         platform::ClientIdentity client) {
  note("cancelled " + nameOf(coordinator) + " by " + std::to_string(static_cast<std::uint64_t>(client)) + " for " +
           reason.domain + " " + std::to_string(reason.code),
       coordinator);
}

void CoordinationListener::note(std::string line, InstallCoordinator& coordinator) {
  EXPECT_EQ(++inside_, 1) << "callbacks to one delegate must not overlap";
  thread_ = std::this_thread::get_id();
  {
    const std::scoped_lock lock(mutex_);
    events_.push_back(std::move(line));
  }
  if (inCallback_) inCallback_(coordinator);
  --inside_;
}

}  // namespace appsync::test
