// The backup service and its connections.
#pragma once

#include <condition_variable>
#include <cstddef>
#include <cstdint>
#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <string_view>
#include <vector>

#include "kit/fakes/CallJournal.h"
#include "kit/fakes/FailurePlan.h"
#include "platform/BackupManager.h"

namespace appsync::test {

enum class BackupOperation { cancelApplicationRestore };

/// The service behind all connections. Journal lines: "backupManager.make", "backupManager.restoreDataExists com.a",
/// "backupManager.cancelApplicationRestore com.a". Fails the test if it is destroyed while a connection is open.
class FakeBackups {
 public:
  explicit FakeBackups(CallJournal& journal) : journal_(journal) {}
  ~FakeBackups();
  FakeBackups(const FakeBackups&) = delete;
  FakeBackups& operator=(const FakeBackups&) = delete;

  /// Sets the number of bytes that the running restore holds for the app.
  void addRestoreData(std::string_view identifier, std::uint64_t size = 1);
  [[nodiscard]] bool hasRestoreData(std::string_view identifier) const;
  FailurePlan<BackupOperation> failures;

  [[nodiscard]] std::unique_ptr<platform::BackupManager> connect();
  [[nodiscard]] std::size_t connections() const;
  /// Blocks until no connection is open. Fails the test on a time-out.
  void waitUntilReleased();

 private:
  class Connection;

  CallJournal& journal_;
  mutable std::mutex mutex_;
  std::condition_variable released_;
  std::map<std::string, std::uint64_t, std::less<>> sizes_;
  std::size_t connections_ = 0;
};

}  // namespace appsync::test
