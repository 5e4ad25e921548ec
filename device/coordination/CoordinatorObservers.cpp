#include "device/coordination/CoordinatorObservers.h"

#include <algorithm>
#include <utility>

namespace appsync::device {

using platform::ClientIdentity;
using platform::InstallObserverDelegate;

class CoordinatorObservers::Connection final : public platform::InstallObserver {
 public:
  Connection(std::shared_ptr<CoordinatorObservers> observers, std::set<ClientIdentity> clients,
             InstallObserverDelegate& delegate)
      : observers_(std::move(observers)), clients_(std::move(clients)), delegate_(delegate) {}
  ~Connection() override { observers_->disconnect(*this); }
  Connection(const Connection&) = delete;
  Connection& operator=(const Connection&) = delete;

  [[nodiscard]] bool wants(ClientIdentity creator) const { return clients_.contains(creator); }
  [[nodiscard]] InstallObserverDelegate& delegate() const { return delegate_; }

 private:
  const std::shared_ptr<CoordinatorObservers> observers_;
  const std::set<ClientIdentity> clients_;
  InstallObserverDelegate& delegate_;
};

std::unique_ptr<platform::InstallObserver> CoordinatorObservers::connect(const std::set<ClientIdentity>& clients,
                                                                         InstallObserverDelegate& delegate) {
  auto connection = std::make_unique<Connection>(shared_from_this(), clients, delegate);
  const std::lock_guard lock(mutex_);
  connections_.push_back(connection.get());
  return connection;
}

void CoordinatorObservers::disconnect(const Connection& connection) {
  {
    const std::lock_guard lock(mutex_);
    std::erase(connections_, &connection);
  }
  callbacks_.forget(&connection);
}

void CoordinatorObservers::notify(ClientIdentity creator, const Observer& observer, const Report& report) {
  const std::lock_guard lock(mutex_);
  std::vector<const void*> notified;
  for (const Connection* connection : connections_) {
    InstallObserverDelegate* delegate = &connection->delegate();
    if (!connection->wants(creator) || std::ranges::find(notified, delegate) != notified.end()) continue;
    notified.push_back(delegate);
    post(connection, [report, delegate] { report(*delegate); });
  }
  if (observer.address == nullptr || std::ranges::find(notified, observer.address) != notified.end()) return;
  post(this, [report, weak = observer.delegate] {
    if (const auto delegate = weak.lock()) report(*delegate);
  });
}

void CoordinatorObservers::post(const void* receiver, std::function<void()> callback) {
  {
    const std::lock_guard lock(pendingMutex_);
    ++pending_;
  }
  // Destroyed when the callback has run or was dropped.
  const std::shared_ptr<void> pending(this, [](void* observers) {
    auto* self = static_cast<CoordinatorObservers*>(observers);
    const std::lock_guard lock(self->pendingMutex_);
    if (--self->pending_ == 0) self->delivered_.notify_all();
  });
  callbacks_.post(receiver, [callback = std::move(callback), pending] { callback(); });
}

bool CoordinatorObservers::waitUntilDelivered(std::chrono::steady_clock::time_point deadline) {
  std::unique_lock lock(pendingMutex_);
  return delivered_.wait_until(lock, deadline, [this] { return pending_ == 0; });
}

}  // namespace appsync::device
