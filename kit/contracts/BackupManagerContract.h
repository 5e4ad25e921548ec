// Holds backup services to platform/BackupManager.h.
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
  /// From now on a restore holds `size` bytes of data for the app.
  virtual void keepRestoreData(std::string_view identifier, std::uint64_t size) = 0;
  /// From now on no restore of an app's data can be given up; false where that cannot be done.
  [[nodiscard]] virtual bool failCancelling() { return false; }
};

class BackupManagerContract : public Contract<BackupManagerSubject> {
 protected:
  std::unique_ptr<platform::BackupManager> manager = subject().makeManager();
};

}  // namespace appsync::test
