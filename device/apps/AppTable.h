// The registry's rows: which apps there are and where their bundles lie.
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

/// An app has up to two bundles: the one that is installed, and the placeholder for a package still to come.
enum class BundleRole : std::uint8_t { installed, placeholder };

/// Whether a placeholder of that type stands for a demoted app: nobody is about to bring its package.
[[nodiscard]] constexpr bool isDemotion(platform::TSInstallType type) noexcept {
  return type == platform::TSInstallType::Downgrade || type == platform::TSInstallType::IntentionalDowngrade;
}

struct StoredBundle {
  std::string container;  ///< the container's name
  std::string folder;     ///< the bundle's, in the container
  std::string name;       ///< for people
  std::optional<std::string> version;
  platform::TSInstallType installType = platform::TSInstallType::None;
  std::uint64_t bytes = 0;  ///< of all files of the container
  double installedAt = 0;   ///< seconds since 1970
};

/// How far a running install is.
struct ProgressValues {
  platform::TSInstallState state = platform::TSInstallState::Waiting;
  platform::TSInstallPhase phase = platform::TSInstallPhase::Loading;
  std::int64_t totalUnits = 1000;
  std::int64_t completedUnits = 0;
  bool operator==(const ProgressValues&) const = default;
};

struct AppRow {
  std::int64_t position = 0;  ///< grows with each app that is new to the device
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

/// Each runs in the session, or transaction, that it is given; an identifier is looked up by index.
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

/// Every app, those with a running install, or those of one type, in the order in which they came to the device.
[[nodiscard]] Result<std::vector<AppRow>> all(Database::Session& session);
[[nodiscard]] Result<std::vector<AppRow>> withProgress(Database::Session& session);
[[nodiscard]] Result<std::vector<AppRow>> ofType(Database::Session& session, std::string_view applicationType);

/// Puts a bundle in its role, in place of what was there. A new app gets `applicationType`, a known one keeps its own,
/// and its licence unless there is a new one.
Status put(Database::Session& session, std::string_view identifier, std::string_view applicationType, BundleRole role,
           const StoredBundle& bundle, const std::optional<Bytes>& licence);

/// Takes a bundle, if `app` has it, and an app that then has none, away.
Status remove(Database::Session& session, const AppRow& app, BundleRole role);

[[nodiscard]] Result<std::optional<Bytes>> licenceOf(Database::Session& session, std::string_view identifier);

/// Of an unknown app nothing is stored.
Status storeProgress(Database::Session& session, std::string_view identifier,
                     const std::optional<ProgressValues>& progress);

}  // namespace app_table

}  // namespace appsync::device
