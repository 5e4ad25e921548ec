// The database tables of coordinators, from which a restart resumes.
#pragma once

#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "device/coordination/CoordinatorState.h"
#include "device/storage/Database.h"

namespace appsync::device::coordinator_table {

inline constexpr const char* kSchema = R"(
create table if not exists coordinators (
  number integer primary key autoincrement,
  identifier text not null,
  kind integer not null,
  creator integer not null,
  responsible_client integer,
  has_odr_assets integer not null default 0,
  install_type integer, install_target integer, store_metadata blob,
  unique (identifier, kind)
) strict;
create table if not exists coordinator_promises (
  coordinator integer not null references coordinators (number) on delete cascade,
  role integer not null,
  name text not null,
  client integer not null,
  disk_space integer not null,
  path text, is_folder integer,
  fraction real not null,
  is_complete integer not null,
  is_cancelled integer not null,
  primary key (coordinator, role)
) strict, without rowid;
create table if not exists coordinator_placeholders (
  coordinator integer primary key references coordinators (number) on delete cascade,
  name text not null,
  client integer not null,
  install_type integer not null,
  info blob not null,
  version text,
  is_launch_prohibited integer not null,
  store_metadata blob,
  licence blob,
  is_configured integer not null
) strict;
create table if not exists spent_packages (path text primary key) strict, without rowid;
)";

/// Returns every coordinator, the oldest first, or none if the tables do not exist yet.
[[nodiscard]] Result<std::vector<std::shared_ptr<CoordinatorState>>> all(Database::Session& session);

/// Inserts a coordinator, replacing the row of an ended one that could not be deleted, and sets `state.number`.
Status insert(Database::Session& session, CoordinatorState& state);

// For a coordinator without a row the following functions store nothing or fail.

Status storeChoices(Database::Session& session, std::int64_t coordinator, const CoordinatorChoices& choices);
/// Stores the coordinator's promise in a role other than `initialODRAsset`.
Status storePromise(Database::Session& session, std::int64_t coordinator, PromiseRole role,
                    const PromiseState& promise);
/// Stores the placeholder and the promise of its icon.
Status storePlaceholder(Database::Session& session, std::int64_t coordinator, const PlaceholderState& placeholder);

/// Deletes a coordinator with its promises and placeholder. Records its package, if the service owns it, as spent.
Status remove(Database::Session& session, const CoordinatorState& state);

/// Returns the paths of packages to delete, which may be deleted already.
[[nodiscard]] Result<std::vector<std::string>> spentPackages(Database::Session& session);
Status forgetSpentPackage(Database::Session& session, std::string_view path);

}  // namespace appsync::device::coordinator_table
