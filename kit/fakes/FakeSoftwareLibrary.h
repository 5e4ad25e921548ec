// The store's library and its connections.
#pragma once

#include <condition_variable>
#include <cstddef>
#include <functional>
#include <memory>
#include <mutex>
#include <optional>
#include <vector>

#include "kit/fakes/CallJournal.h"
#include "kit/fakes/FakeCallbackThread.h"
#include "platform/SoftwareLibrary.h"

namespace appsync::test {

/// The time at which a refresh of receipts completes.
enum class RefreshCompletion {
  beforeReturn,
  onOwnThread,
  whenTold,  ///< at `FakeStore::complete`
};

/// The store behind all connections. Journal lines: "softwareLibrary.make", "softwareLibrary.refreshReceipts",
/// "softwareLibrary.release". Fails the test if a connection is destroyed before its completion has begun, or the store
/// is destroyed while a connection is open.
class FakeStore {
 public:
  explicit FakeStore(CallJournal& journal) : journal_(journal) {}
  ~FakeStore();
  FakeStore(const FakeStore&) = delete;
  FakeStore& operator=(const FakeStore&) = delete;

  void completeRefreshes(RefreshCompletion when, std::optional<Error> error = std::nullopt);
  /// Completes the pending refreshes on the calling thread.
  void complete();
  /// Blocks until `count` refreshes are pending.
  void waitUntilPending(std::size_t count);

  [[nodiscard]] std::unique_ptr<platform::SoftwareLibrary> connect();
  [[nodiscard]] std::size_t connections() const;

 private:
  using Completion = std::function<void(const std::optional<Error>& error)>;
  class Connection;
  struct Pending {
    Connection* connection;
    std::function<void()> complete;
  };

  void refresh(Connection& connection, Completion completion);
  void close(Connection& connection);

  CallJournal& journal_;
  mutable std::mutex mutex_;
  std::condition_variable changed_;
  RefreshCompletion when_ = RefreshCompletion::beforeReturn;
  std::optional<Error> error_;
  std::vector<Pending> pending_;
  std::size_t connections_ = 0;
  FakeCallbackThread thread_;
};

}  // namespace appsync::test
