#include "kit/fakes/FakeTransactionLog.h"

#include <utility>

#include "kit/fakes/CallJournal.h"

namespace appsync::test {

namespace {

char letter(Success success) {
  return success == Success::yes ? 'y' : 'n';
}

Success successOf(bool success) {
  return success ? Success::yes : Success::no;
}

template <class... Parts>
std::string joined(std::string first, const Parts&... parts) {
  ((first.append(" ") += parts), ...);
  return first;
}

}  // namespace

std::shared_ptr<platform::SystemLogHandle> FakeSystemLog::createHandle(std::string_view subsystem,
                                                                       std::string_view category) {
  static_cast<void>(journal_.beforeCall("systemLog.createHandle", joined(std::string(subsystem), category)));
  return std::make_shared<FakeSystemLogHandle>(subsystem, category);
}

std::ostream& operator<<(std::ostream& out, const ScenarioEntry& entry) {
  return out << entry.scenario << " | " << entry.step << " | " << letter(entry.success) << " | "
             << entry.bundleIdentifier << " | " << entry.description;
}

std::ostream& operator<<(std::ostream& out, const StepEntry& entry) {
  return out << "step " << static_cast<std::uint32_t>(entry.step) << " | party "
             << static_cast<std::uint32_t>(entry.party) << " | phase " << static_cast<std::uint32_t>(entry.phase)
             << " | " << letter(entry.success) << " | " << entry.bundleIdentifier << " | " << entry.description;
}

std::vector<ScenarioEntry> FakeTransactionLog::scenarios() const {
  const std::scoped_lock lock(mutex_);
  return scenarios_;
}

std::vector<StepEntry> FakeTransactionLog::steps() const {
  const std::scoped_lock lock(mutex_);
  return steps_;
}

std::shared_ptr<FakeSystemLogHandle> FakeTransactionLog::log() const {
  const std::scoped_lock lock(mutex_);
  return std::dynamic_pointer_cast<FakeSystemLogHandle>(log_);
}

void FakeTransactionLog::initializeWithLog(std::shared_ptr<platform::SystemLogHandle> log) {
  if (log == nullptr) misuse("the transaction log is given no log");
  static_cast<void>(journal_.beforeCall("transactionLog.initializeWithLog"));
  const std::scoped_lock lock(mutex_);
  log_ = std::move(log);
}

void FakeTransactionLog::checkInitialized() const {
  if (log_ == nullptr) misuse("an entry is logged before the transaction log has a log");
}

void FakeTransactionLog::logStep(platform::TransactionStep step, platform::TransactionParty party,
                                 platform::TransactionPhase phase, bool success, std::string_view bundleIdentifier,
                                 std::string_view description) {
  const std::string number = std::to_string(static_cast<std::uint32_t>(step));
  const Success succeeded = successOf(success);
  if (journal_.beforeCall("transactionLog.logStep", joined(number, bundleIdentifier, letter(succeeded), description))) {
    return;
  }
  const std::scoped_lock lock(mutex_);
  checkInitialized();
  steps_.push_back({step, phase, succeeded, std::string(bundleIdentifier), std::string(description), party});
}

void FakeTransactionLog::logScenario(std::string_view scenario, std::uint32_t step, bool success,
                                     std::string_view bundleIdentifier, std::string_view description) {
  const Success succeeded = successOf(success);
  if (journal_.beforeCall("transactionLog.logScenario",
                          joined(std::string(scenario), bundleIdentifier, letter(succeeded), description))) {
    return;
  }
  const std::scoped_lock lock(mutex_);
  checkInitialized();
  scenarios_.push_back(
      {std::string(scenario), succeeded, std::string(bundleIdentifier), std::string(description), step});
}

}  // namespace appsync::test
