#include "device/apps/UninstalledApps.h"

#include <chrono>

#include "device/storage/Database.h"

namespace appsync::device {

namespace {

/// Returns the seconds since the epoch of property lists, 2001-01-01.
double secondsNow() {
  using namespace std::chrono;
  constexpr sys_days kEpoch = year(2001) / January / 1;
  return duration<double>(system_clock::now() - kEpoch).count();
}

}  // namespace

std::optional<plist::Dictionary> UninstalledApps::lookupUninstalled() {
  Database::Session session(database_);
  Statement query = session.prepare("select identifier, removed_at from uninstalled_apps order by identifier");
  plist::Dictionary removed;
  while (query.next())
    removed.set(query.text(0), plist::Date{query.real(1)});
  if (!query.status()) return std::nullopt;
  return removed;
}

int UninstalledApps::clearUninstalled(const std::vector<std::string>& bundleIdentifiers) {
  Database::Transaction transaction(database_);
  for (const std::string& identifier : bundleIdentifiers) {
    if (!remove(transaction, identifier)) break;  // The commit then fails with the reason.
  }
  const Status committed = transaction.commit();
  return committed ? 0 : systemErrorOf(committed.error());
}

Status UninstalledApps::add(Database::Session& session, std::string_view bundleIdentifier) {
  return session.run("insert or replace into uninstalled_apps values (?, ?)", bundleIdentifier, secondsNow());
}

Status UninstalledApps::remove(Database::Session& session, std::string_view bundleIdentifier) {
  return session.run("delete from uninstalled_apps where identifier = ?", bundleIdentifier);
}

}  // namespace appsync::device
