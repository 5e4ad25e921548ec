// The transaction log and the handles of the system log.
#pragma once

#include <chrono>
#include <cstdint>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "base/Error.h"
#include "platform/TransactionLog.h"

namespace appsync::device {

class Database;

/// The origin of log entries.
class SystemLogHandle final : public platform::SystemLogHandle {
 public:
  SystemLogHandle(std::string_view subsystem, std::string_view category) : subsystem_(subsystem), category_(category) {}

  [[nodiscard]] const std::string& subsystem() const { return subsystem_; }
  [[nodiscard]] const std::string& category() const { return category_; }

 private:
  const std::string subsystem_;
  const std::string category_;
};

class SystemLog final : public platform::SystemLog {
 public:
  [[nodiscard]] std::shared_ptr<platform::SystemLogHandle> createHandle(std::string_view subsystem,
                                                                        std::string_view category) override;
};

/// An entry for a step, with a code, party and phase, or for a scenario, with a name and step number.
struct TransactionEntry {
  std::chrono::sys_time<std::chrono::microseconds> time;
  std::string subsystem;  ///< from the log's handle; empty before `initializeWithLog`
  std::string category;
  std::uint32_t step = 0;                           ///< a `TransactionStep`, or the scenario's step number
  std::optional<std::string> scenario;              ///< nullopt for a step
  std::optional<platform::TransactionParty> party;  ///< nullopt for a scenario
  std::optional<platform::TransactionPhase> phase;  ///< nullopt for a scenario
  bool success = false;
  std::string bundleIdentifier;
  std::string description;
};

/// Stores entries in the device's database, in the order of the calls. An entry survives a crash once the call has
/// returned; a power failure may lose the last few. Thread-safe.
class TransactionLog final : public platform::TransactionLog {
 public:
  static constexpr const char* kSchema =
      "create table if not exists transaction_log (number integer primary key, time integer not null,"
      " subsystem text not null, category text not null, step integer not null, scenario text, party integer,"
      " phase integer, success integer not null, identifier text not null, description text not null);";

  /// `database` must outlive the log.
  explicit TransactionLog(Database& database) : database_(database) {}

  void initializeWithLog(std::shared_ptr<platform::SystemLogHandle> log) override;
  void logStep(platform::TransactionStep step, platform::TransactionParty party, platform::TransactionPhase phase,
               bool success, std::string_view bundleIdentifier, std::string_view description) override;
  void logScenario(std::string_view scenario, std::uint32_t step, bool success, std::string_view bundleIdentifier,
                   std::string_view description) override;

  /// Returns every entry, the oldest first.
  [[nodiscard]] Result<std::vector<TransactionEntry>> entries();

 private:
  /// A `TransactionEntry` to store.
  struct NewEntry {
    std::uint32_t step;
    std::optional<std::string_view> scenario;
    std::optional<platform::TransactionParty> party;
    std::optional<platform::TransactionPhase> phase;
    bool success;
    std::string_view bundleIdentifier;
    std::string_view description;
  };

  void append(const NewEntry& entry);

  Database& database_;
  std::mutex mutex_;
  std::shared_ptr<platform::SystemLogHandle> handle_;
};

/// Returns the step's name for users, such as "install app".
[[nodiscard]] std::string_view nameOf(platform::TransactionStep step);

}  // namespace appsync::device
