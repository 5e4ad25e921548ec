// The database tables of apps and their bundles.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "base/Bytes.h"
#include "base/Error.h"
#include "device/storage/Database.h"
#include "platform/InstallTypes.h"

namespace appsync::device {

/// An app has up to two bundles: the installed one, and the placeholder of a package that is not installed yet.
enum class BundleRole : std::uint8_t { installed, placeholder };

/// Returns whether a placeholder of that type belongs to a demoted app, for which no package is expected.
[[nodiscard]] constexpr bool isDemotion(platform::TSInstallType type) noexcept {
  return type == platform::TSInstallType::Downgrade || type == platform::TSInstallType::IntentionalDowngrade;
}

struct StoredBundle {
  std::string container;  ///< the name of the container
  std::string folder;     ///< the name of the bundle in the container
  std::string name;       ///< the display name
  std::optional<std::string> version;
  platform::TSInstallType installType = platform::TSInstallType::None;
  std::uint64_t bytes = 0;  ///< of all files of the container
  double installedAt = 0;   ///< seconds since 1970
};

/// The progress of a running install.
struct ProgressValues {
  platform::TSInstallState state = platform::TSInstallState::Waiting;
  platform::TSInstallPhase phase = platform::TSInstallPhase::Loading;
  std::int64_t totalUnits = 1000;
  std::int64_t completedUnits = 0;
  bool operator==(const ProgressValues&) const = default;
};

struct AppRow {
  std::int64_t position = 0;  ///< increases with each new app
  std::string identifier;
  std::string applicationType;
  std::optional<StoredBundle> installed;
  std::optional<StoredBundle> placeholder;
  bool hasDeviceBoundLicence = false;
  std::optional<ProgressValues> progress;

  [[nodiscard]] const std::optional<StoredBundle>& bundle(BundleRole role) const noexcept {
    return role == BundleRole::installed ? installed : placeholder;
  }
};

/// Returns whether the licence is a property-list dictionary with a string under "DeviceIdentifier". The embedded
/// device has no identifier and accepts any; all other licences, including an empty one, are valid on any device.
[[nodiscard]] bool isDeviceBound(ByteView licence);

/// Each function runs in the given session or transaction.
namespace app_table {

inline constexpr const char* kSchema = R"(
create table if not exists apps (
  position integer primary key autoincrement,
  identifier text not null unique,
  application_type text not null,
  run_state integer, run_phase integer, run_total integer, run_completed integer
) strict;
create index if not exists apps_by_type on apps (application_type, position);
create table if not exists bundles (
  app integer not null references apps (position) on delete cascade,
  role integer not null,
  container text not null,
  folder text not null,
  name text not null,
  version text,
  install_type integer not null,
  bytes integer not null,
  installed_at real not null,
  licence blob,
  primary key (app, role)
) strict, without rowid;
)";

[[nodiscard]] Result<std::optional<AppRow>> find(Database::Session& session, std::string_view identifier);

/// Return every app, those with a running install, or those of a type, ordered by `position`.
[[nodiscard]] Result<std::vector<AppRow>> all(Database::Session& session);
[[nodiscard]] Result<std::vector<AppRow>> withProgress(Database::Session& session);
[[nodiscard]] Result<std::vector<AppRow>> ofType(Database::Session& session, std::string_view applicationType);

/// Inserts or replaces the app's bundle in a role. An existing app keeps its application type and, if `licence` is
/// nullopt, its licence.
Status put(Database::Session& session, std::string_view identifier, std::string_view applicationType, BundleRole role,
           const StoredBundle& bundle, const std::optional<Bytes>& licence);

/// Deletes the bundle in a role, if any, and the app if it has no bundle left.
Status remove(Database::Session& session, const AppRow& app, BundleRole role);

[[nodiscard]] Result<std::optional<Bytes>> licenceOf(Database::Session& session, std::string_view identifier);

/// Does nothing for an unknown app.
Status storeProgress(Database::Session& session, std::string_view identifier,
                     const std::optional<ProgressValues>& progress);

}  // namespace app_table

}  // namespace appsync::device
