// The coordinators' rows: what a restart takes up again.
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

/// Every coordinator, in the order in which they were made; none where the tables are still missing.
[[nodiscard]] Result<std::vector<std::shared_ptr<CoordinatorState>>> all(Database::Session& session);

/// Makes a row, in place of one that could not be taken away when its coordinator ended, and gives `state` its number.
Status insert(Database::Session& session, CoordinatorState& state);

// Of a coordinator whose row has gone nothing is stored, or the statement fails.

Status storeChoices(Database::Session& session, std::int64_t coordinator, const CoordinatorChoices& choices);
/// The coordinator's promise in that role, which is not one for initial ODR assets.
Status storePromise(Database::Session& session, std::int64_t coordinator, PromiseRole role,
                    const PromiseState& promise);
/// The placeholder with its icon's promise.
Status storePlaceholder(Database::Session& session, std::int64_t coordinator, const PlaceholderState& placeholder);

/// Takes a coordinator away with all that is its. A package that is the service's by then is spent from now on.
Status remove(Database::Session& session, const CoordinatorState& state);

/// Packages that are to be removed and may still be there.
[[nodiscard]] Result<std::vector<std::string>> spentPackages(Database::Session& session);
Status forgetSpentPackage(Database::Session& session, std::string_view path);

}  // namespace appsync::device::coordinator_table
