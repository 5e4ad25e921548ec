#include "tests/support/FakeInstallCoordination.h"

#include <algorithm>

#include "tests/support/Misuse.h"

namespace appsync::test {

class FakeInstallCoordination::Observer final : public platform::InstallObserver {
 public:
  Observer(FakeInstallCoordination& service, std::size_t index) : service_(service), index_(index) {}
  ~Observer() override { service_.close(index_); }
  Observer(const Observer&) = delete;
  Observer& operator=(const Observer&) = delete;

 private:
  FakeInstallCoordination& service_;
  std::size_t index_;
};

FakeInstallCoordination::~FakeInstallCoordination() {
  if (std::ranges::any_of(connections_, &Connection::isOpen)) {
    misuse("install coordination goes while a connection is open");
  }
}

void FakeInstallCoordination::enable() {
  const std::scoped_lock lock(mutex_);
  isEnabled_ = true;
}

std::vector<FakeInstallCoordination::Connection> FakeInstallCoordination::connections() const {
  const std::scoped_lock lock(mutex_);
  return connections_;
}

bool FakeInstallCoordination::coordinationIsEnabled() {
  if (journal_.beforeCall("installCoordination.coordinationIsEnabled")) return false;
  const std::scoped_lock lock(mutex_);
  return isEnabled_;
}

std::unique_ptr<platform::InstallObserver> FakeInstallCoordination::initWithMachServiceName(
    std::string_view serviceName, const std::set<platform::ClientIdentity>& clients,
    platform::InstallObserverDelegate& delegate) {
  static_cast<void>(journal_.beforeCall("installCoordination.initWithMachServiceName", serviceName));
  const std::scoped_lock lock(mutex_);
  connections_.push_back({std::string(serviceName), clients, &delegate});
  return std::make_unique<Observer>(*this, connections_.size() - 1);
}

void FakeInstallCoordination::close(std::size_t index) {
  const std::scoped_lock lock(mutex_);
  connections_[index].isOpen = false;
  journal_.note("installCoordination.close " + connections_[index].serviceName);
}

}  // namespace appsync::test
