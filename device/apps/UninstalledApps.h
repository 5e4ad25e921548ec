// The installer's list of removed apps.
#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "device/storage/Database.h"
#include "platform/UninstalledAppsList.h"

namespace appsync::device {

/// Stored in the device's database. The values are the dates of removal.
class UninstalledApps final : public platform::UninstalledAppsList {
 public:
  static constexpr const char* kSchema =
      "create table if not exists uninstalled_apps (identifier text primary key, removed_at real not null) strict, "
      "without rowid;";

  /// `database` must outlive the list.
  explicit UninstalledApps(Database& database) : database_(database) {}

  [[nodiscard]] std::optional<plist::Dictionary> lookupUninstalled() override;
  [[nodiscard]] int clearUninstalled(const std::vector<std::string>& bundleIdentifiers) override;

  // For the installer's transactions.
  static Status add(Database::Session& session, std::string_view bundleIdentifier);
  static Status remove(Database::Session& session, std::string_view bundleIdentifier);

 private:
  Database& database_;
};

}  // namespace appsync::device
