#include "device/services/TransactionLog.h"

#include <utility>

#include "device/storage/Database.h"

namespace appsync::device {

namespace {

std::int64_t microsecondsNow() {
  const auto now = std::chrono::system_clock::now().time_since_epoch();
  return std::chrono::duration_cast<std::chrono::microseconds>(now).count();
}

template <class Enumeration>
std::optional<Enumeration> enumerator(const Statement& row, int column) {
  if (row.isNull(column)) return std::nullopt;
  return static_cast<Enumeration>(row.integer(column));
}

TransactionEntry entryOf(const Statement& row) {
  return {.time = std::chrono::sys_time<std::chrono::microseconds>(std::chrono::microseconds(row.integer(0))),
          .subsystem = std::string(row.text(1)),
          .category = std::string(row.text(2)),
          .step = static_cast<std::uint32_t>(row.integer(3)),
          .scenario = row.optionalText(4),
          .party = enumerator<platform::TransactionParty>(row, 5),
          .phase = enumerator<platform::TransactionPhase>(row, 6),
          .success = row.integer(7) != 0,
          .bundleIdentifier = std::string(row.text(8)),
          .description = std::string(row.text(9))};
}

}  // namespace

std::shared_ptr<platform::SystemLogHandle> SystemLog::createHandle(std::string_view subsystem,
                                                                   std::string_view category) {
  return std::make_shared<SystemLogHandle>(subsystem, category);
}

void TransactionLog::initializeWithLog(std::shared_ptr<platform::SystemLogHandle> log) {
  const std::lock_guard lock(mutex_);
  std::swap(handle_, log);
}

void TransactionLog::logStep(platform::TransactionStep step, platform::TransactionParty party,
                             platform::TransactionPhase phase, bool success, std::string_view bundleIdentifier,
                             std::string_view description) {
  append({.step = static_cast<std::uint32_t>(step),
          .scenario = std::nullopt,
          .party = party,
          .phase = phase,
          .success = success,
          .bundleIdentifier = bundleIdentifier,
          .description = description});
}

void TransactionLog::logScenario(std::string_view scenario, std::uint32_t step, bool success,
                                 std::string_view bundleIdentifier, std::string_view description) {
  append({.step = step,
          .scenario = scenario,
          .party = std::nullopt,
          .phase = std::nullopt,
          .success = success,
          .bundleIdentifier = bundleIdentifier,
          .description = description});
}

void TransactionLog::append(const NewEntry& entry) {
  const auto handle = [this] {
    const std::lock_guard lock(mutex_);
    return std::dynamic_pointer_cast<SystemLogHandle>(handle_);
  }();
  Database::Session session(database_);
  session
      .run("insert into transaction_log values (null, ?, ?, ?, ?, ?, ?, ?, ?, ?, ?)", microsecondsNow(),
           handle ? handle->subsystem() : std::string(), handle ? handle->category() : std::string(), entry.step,
           entry.scenario, entry.party, entry.phase, entry.success, entry.bundleIdentifier, entry.description)
      .ignore();
}

Result<std::vector<TransactionEntry>> TransactionLog::entries() {
  std::vector<TransactionEntry> entries;
  Database::Session session(database_);
  Statement rows = session.prepare(
      "select time, subsystem, category, step, scenario, party, phase, success, identifier, description"
      " from transaction_log order by number");
  while (rows.next())
    entries.push_back(entryOf(rows));
  if (!rows.status()) return rows.status().error();
  return entries;
}

std::string_view nameOf(platform::TransactionStep step) {
  switch (step) {
    case platform::TransactionStep::installApp:
      return "install app";
    case platform::TransactionStep::restoreApp:
      return "restore app";
    case platform::TransactionStep::createCoordinator:
      return "create coordinator";
    case platform::TransactionStep::createPlaceholder:
      return "create placeholder";
    case platform::TransactionStep::copyIcon:
      return "copy icon";
    case platform::TransactionStep::uninstallApp:
      return "uninstall app";
  }
  return "unknown step";
}

}  // namespace appsync::device
