// Holds transaction logs and the system's log to platform/TransactionLog.h.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "kit/contracts/Contract.h"
#include "platform/TransactionLog.h"

namespace appsync::test {

/// An entry as the log kept it: a step's, with party and phase, or a scenario's.
struct KeptEntry {
  std::uint32_t step = 0;
  std::optional<std::string> scenario;
  std::optional<platform::TransactionParty> party;
  std::optional<platform::TransactionPhase> phase;
  bool success = false;
  std::string bundleIdentifier;
  std::string description;
  bool operator==(const KeptEntry&) const = default;
};

class TransactionLogSubject {
 public:
  virtual ~TransactionLogSubject() = default;

  [[nodiscard]] virtual platform::TransactionLog& log() = 0;
  [[nodiscard]] virtual platform::SystemLog& systemLog() = 0;
  /// What the log has kept, oldest first.
  [[nodiscard]] virtual std::vector<KeptEntry> entries() = 0;
};

class TransactionLogContract : public Contract<TransactionLogSubject> {
 protected:
  /// As clients do it: the log is then the handle's only owner.
  void initialize() { subject().log().initializeWithLog(subject().systemLog().createHandle("subsystem", "category")); }
};

}  // namespace appsync::test
