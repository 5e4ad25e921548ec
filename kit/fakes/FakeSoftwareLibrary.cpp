#include "kit/fakes/FakeSoftwareLibrary.h"

#include <algorithm>
#include <utility>

#include "kit/fakes/CallJournal.h"
#include "kit/fakes/Patience.h"

namespace appsync::test {

class FakeStore::Connection final : public platform::SoftwareLibrary {
 public:
  explicit Connection(FakeStore& store) : store_(store) {}
  ~Connection() override { store_.close(*this); }
  Connection(const Connection&) = delete;
  Connection& operator=(const Connection&) = delete;

  void refreshReceipts(Completion completion) override { store_.refresh(*this, std::move(completion)); }

 private:
  FakeStore& store_;
};

FakeStore::~FakeStore() {
  if (connections_ != 0) misuse("the store is destroyed while a connection is open");
}

void FakeStore::completeRefreshes(RefreshCompletion when, std::optional<Error> error) {
  const std::scoped_lock lock(mutex_);
  when_ = when;
  error_ = std::move(error);
}

void FakeStore::complete() {
  std::vector<Pending> pending;
  {
    const std::scoped_lock lock(mutex_);
    pending.swap(pending_);
  }
  for (const Pending& refresh : pending)
    refresh.complete();
}

void FakeStore::waitUntilPending(std::size_t count) {
  std::unique_lock lock(mutex_);
  awaitReady(
      changed_, lock, [&] { return pending_.size() >= count; }, "too few refreshes are asked for");
}

std::unique_ptr<platform::SoftwareLibrary> FakeStore::connect() {
  static_cast<void>(journal_.beforeCall("softwareLibrary.make"));
  const std::scoped_lock lock(mutex_);
  ++connections_;
  return std::make_unique<Connection>(*this);
}

std::size_t FakeStore::connections() const {
  const std::scoped_lock lock(mutex_);
  return connections_;
}

void FakeStore::refresh(Connection& connection, Completion completion) {
  std::optional<Error> error = journal_.beforeCall("softwareLibrary.refreshReceipts");
  std::unique_lock lock(mutex_);
  if (!error) error = error_;
  auto complete = [completion = std::move(completion), error = std::move(error)] { completion(error); };
  switch (when_) {
    case RefreshCompletion::beforeReturn:
      lock.unlock();
      complete();
      break;
    case RefreshCompletion::onOwnThread: {
      const FakeCallbackThread::Subscription subscription = thread_.subscribe();
      thread_.post(subscription, std::move(complete));
      break;
    }
    case RefreshCompletion::whenTold:
      pending_.push_back({&connection, std::move(complete)});
      changed_.notify_all();
      break;
  }
}

void FakeStore::close(Connection& connection) {
  journal_.note("softwareLibrary.release");
  const std::scoped_lock lock(mutex_);
  --connections_;
  const auto pending = std::ranges::find(pending_, &connection, &Pending::connection);
  if (pending == pending_.end()) return;
  misuse("a connection to the store is destroyed before its refresh completed");
  std::erase_if(pending_, [&](const Pending& refresh) { return refresh.connection == &connection; });
}

}  // namespace appsync::test
