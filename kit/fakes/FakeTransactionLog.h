// The transaction log and the system log.
#pragma once

#include <cstdint>
#include <memory>
#include <mutex>
#include <ostream>
#include <string>
#include <string_view>
#include <vector>

#include "kit/fakes/CallJournal.h"
#include "platform/TransactionLog.h"

namespace appsync::test {

struct FakeSystemLogHandle final : platform::SystemLogHandle {
  FakeSystemLogHandle(std::string_view subsystemName, std::string_view categoryName)
      : subsystem(subsystemName), category(categoryName) {}

  const std::string subsystem;
  const std::string category;
};

/// Journal line: "systemLog.createHandle subsystem category".
class FakeSystemLog final : public platform::SystemLog {
 public:
  explicit FakeSystemLog(CallJournal& journal) : journal_(journal) {}

  [[nodiscard]] std::shared_ptr<platform::SystemLogHandle> createHandle(std::string_view subsystem,
                                                                        std::string_view category) override;

 private:
  CallJournal& journal_;
};

enum class Success : bool { no, yes };

/// One event of a scenario.
struct ScenarioEntry {
  std::string scenario;
  Success success = Success::yes;
  std::string bundleIdentifier;
  std::string description;
  std::uint32_t step = 0;
  bool operator==(const ScenarioEntry&) const = default;
};
std::ostream& operator<<(std::ostream& out, const ScenarioEntry& entry);

struct StepEntry {
  platform::TransactionStep step{};
  platform::TransactionPhase phase{};
  Success success = Success::yes;
  std::string bundleIdentifier;
  std::string description;
  platform::TransactionParty party = platform::TransactionParty::syncClient;
  bool operator==(const StepEntry&) const = default;
};
std::ostream& operator<<(std::ostream& out, const StepEntry& entry);

/// Journal lines: "transactionLog.initializeWithLog", "transactionLog.logScenario Harvo Sync com.a y Uninstall
/// succeeded". Fails the test if an entry precedes `initializeWithLog`, or if the log is null.
class FakeTransactionLog final : public platform::TransactionLog {
 public:
  explicit FakeTransactionLog(CallJournal& journal) : journal_(journal) {}

  [[nodiscard]] std::vector<ScenarioEntry> scenarios() const;
  [[nodiscard]] std::vector<StepEntry> steps() const;
  /// The latest handle; null before `initializeWithLog`.
  [[nodiscard]] std::shared_ptr<FakeSystemLogHandle> log() const;

  void initializeWithLog(std::shared_ptr<platform::SystemLogHandle> log) override;
  void logStep(platform::TransactionStep step, platform::TransactionParty party, platform::TransactionPhase phase,
               bool success, std::string_view bundleIdentifier, std::string_view description) override;
  void logScenario(std::string_view scenario, std::uint32_t step, bool success, std::string_view bundleIdentifier,
                   std::string_view description) override;

 private:
  void checkInitialized() const;

  CallJournal& journal_;
  mutable std::mutex mutex_;
  std::shared_ptr<platform::SystemLogHandle> log_;
  std::vector<ScenarioEntry> scenarios_;
  std::vector<StepEntry> steps_;
};

}  // namespace appsync::test
