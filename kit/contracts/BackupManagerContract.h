// Contract of platform/BackupManager.h.
#pragma once

#include <cstdint>
#include <memory>
#include <string_view>

#include "kit/contracts/Contract.h"
#include "platform/BackupManager.h"

namespace appsync::test {

class BackupManagerSubject {
 public:
  virtual ~BackupManagerSubject() = default;

  [[nodiscard]] virtual std::unique_ptr<platform::BackupManager> makeManager() = 0;
  /// Adds restore data of `size` bytes for the app.
  virtual void keepRestoreData(std::string_view identifier, std::uint64_t size) = 0;
  /// Makes all later cancellations fail. Returns false if not supported.
  [[nodiscard]] virtual bool failCancelling() { return false; }
};

class BackupManagerContract : public Contract<BackupManagerSubject> {
 protected:
  std::unique_ptr<platform::BackupManager> manager = subject().makeManager();
};

}  // namespace appsync::test
