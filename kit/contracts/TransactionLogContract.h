// Contract of platform/TransactionLog.h.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "kit/contracts/Contract.h"
#include "platform/TransactionLog.h"

namespace appsync::test {

/// A recorded entry: a step with party and phase, or a scenario.
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
  /// Returns the recorded entries, oldest first.
  [[nodiscard]] virtual std::vector<KeptEntry> entries() = 0;
};

class TransactionLogContract : public Contract<TransactionLogSubject> {
 protected:
  /// Passes ownership of the handle to the log, as clients do.
  void initialize() { subject().log().initializeWithLog(subject().systemLog().createHandle("subsystem", "category")); }
};

}  // namespace appsync::test
