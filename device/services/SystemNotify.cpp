#include "device/services/SystemNotify.h"

#include <algorithm>

#include "device/storage/Database.h"

namespace appsync::device {

void SystemNotify::addObserver(void* observer, Callback callback, std::string_view name, const void* object,
                               platform::SuspensionBehavior) {
  const std::lock_guard lock(mutex_);
  const Observation added{observer, callback, std::string(name), object};
  const bool isKnown = std::ranges::any_of(observations_, [&](const auto& known) { return *known == added; });
  if (!isKnown) observations_.push_back(std::make_shared<const Observation>(added));
}

void SystemNotify::removeObserver(void* observer, std::string_view name) {
  std::vector<std::shared_ptr<const Observation>> removed;
  {
    const std::lock_guard lock(mutex_);
    const auto first = std::stable_partition(observations_.begin(), observations_.end(), [&](const auto& known) {
      return known->observer != observer || known->name != name;
    });
    removed.assign(first, observations_.end());
    observations_.erase(first, observations_.end());
  }
  for (const auto& observation : removed)
    callbacks_.forget(observation.get());
}

platform::SystemNotify::Registration SystemNotify::registerCheck(std::string_view name) {
  if (name.empty()) return {.status = kInvalidName, .token = 0};
  const std::lock_guard lock(mutex_);
  if (const auto known = tokensByName_.find(name); known != tokensByName_.end()) {
    return {.status = 0, .token = known->second};
  }
  tokens_.emplace_back(name);
  const auto token = static_cast<Token>(tokens_.size());
  tokensByName_.emplace(name, token);
  return {.status = 0, .token = token};
}

void SystemNotify::setState(Token token, std::uint64_t state) {
  const std::lock_guard lock(mutex_);
  if (token < 1 || static_cast<std::size_t>(token) > tokens_.size()) return;
  Database::Session session(database_);
  session
      .run("insert or replace into notification_states values (?, ?)", tokens_[static_cast<std::size_t>(token) - 1],
           state)
      .ignore();
}

void SystemNotify::post(std::string_view name) {
  // The lock keeps a removed observer's callback from being queued after `removeObserver` has dropped the others.
  const std::lock_guard lock(mutex_);
  for (const auto& observation : observations_) {
    if (observation->name != name || observation->object != nullptr) continue;
    callbacks_.post(observation.get(),
                    [observation] { observation->callback(observation->observer, observation->name, nullptr); });
  }
}

std::optional<std::uint64_t> SystemNotify::state(std::string_view name) {
  Database::Session session(database_);
  Statement row = session.prepare("select state from notification_states where name = ?", name);
  if (!row.next()) return std::nullopt;
  return static_cast<std::uint64_t>(row.integer(0));
}

}  // namespace appsync::device
