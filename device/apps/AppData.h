// The data of apps: where it lies, how a restore keeps it for them, and how it goes.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "base/Error.h"
#include "device/storage/Database.h"
#include "device/storage/DeviceFileSystem.h"

namespace appsync::device {

/// Device path of the folder of all data containers, each named after its app. An app without data has none.
inline constexpr std::string_view kDataPath = "/var/mobile/Containers/Data";
/// Device path of the folder in which the backup service keeps what a restore brought, by app.
inline constexpr std::string_view kRestoreDataPath = "/var/mobile/Library/Vaultory/RestoreData";

/// "…/Data/com.example.notes".
[[nodiscard]] std::string dataContainerOf(std::string_view identifier);

/// Data outlives its app's updates and demotion, and goes when the app is removed. Data that a restore keeps is the
/// app's from the moment in which its package is in.
namespace app_data {

inline constexpr const char* kSchema = R"(
create table if not exists restore_data (identifier text primary key, size integer not null) without rowid;
create table if not exists removed_data (identifier text primary key) without rowid;
)";

/// Keeps a copy of a folder of this machine for the app, in place of what was kept. It is on the disk when this
/// returns; a failure or a kill leaves what was there, or nothing.
[[nodiscard]] Status keep(DeviceFileSystem& files, Database& database, std::string_view identifier,
                          const std::string& hostFolder);

/// The bytes that are kept for the app, as they were counted.
[[nodiscard]] Result<bool> isKept(Database::Session& session, std::string_view identifier, std::uint64_t* size);

/// Drops what is kept.
[[nodiscard]] Status drop(DeviceFileSystem& files, Database& database, std::string_view identifier);

/// Puts what is kept, if anything is, in the data container's place. Until `deleteRestoreRecord` it counts as kept all
/// the same, and doing it again does no harm.
[[nodiscard]] Status commitRestoreData(DeviceFileSystem& files, Database& database, std::string_view identifier);
Status deleteRestoreRecord(Database::Session& session, std::string_view identifier);

/// All data of a removed app is to go, that which is kept too; and goes now, or when the device is opened next.
Status markRemoved(Database::Session& session, std::string_view identifier);
void sweepRemoved(DeviceFileSystem& files, Database& database, std::string_view identifier);

/// After a process was cut off: what was to go goes, and what was never kept as a whole.
[[nodiscard]] Status recover(DeviceFileSystem& files, Database& database);

}  // namespace app_data

}  // namespace appsync::device
