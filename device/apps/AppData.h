// The data of apps: containers, data kept by a restore, removal.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "base/Error.h"
#include "device/storage/Database.h"
#include "device/storage/DeviceFileSystem.h"

namespace appsync::device {

/// Device path of the directory of data containers, each named after its app. Apps without data have no container.
inline constexpr std::string_view kDataPath = "/var/mobile/Containers/Data";
/// Device path of the directory in which the backup service keeps restored data, by app.
inline constexpr std::string_view kRestoreDataPath = "/var/mobile/Library/Vaultory/RestoreData";

/// Returns the path of an app's data container: "…/Data/com.example.notes".
[[nodiscard]] std::string dataContainerOf(std::string_view identifier);

/// Updates and demotion keep an app's data; removal of the app deletes it. Data kept by a restore is moved to the app's
/// container when its package is installed.
namespace app_data {

inline constexpr const char* kSchema = R"(
create table if not exists restore_data (identifier text primary key, size integer not null) without rowid;
create table if not exists removed_data (identifier text primary key) without rowid;
)";

/// Keeps a copy of a host directory for the app, replacing the previous one. Durable. A failure or crash leaves the
/// previous copy or none.
[[nodiscard]] Status keep(DeviceFileSystem& files, Database& database, std::string_view identifier,
                          const std::string& hostFolder);

/// Returns whether data is kept for the app and, if `size` is not null, its size in bytes.
[[nodiscard]] Result<bool> isKept(Database::Session& session, std::string_view identifier, std::uint64_t* size);

/// Deletes the data that is kept for the app.
[[nodiscard]] Status drop(DeviceFileSystem& files, Database& database, std::string_view identifier);

/// Replaces the app's data container by its kept data, if any. Idempotent. The data counts as kept until
/// `deleteRestoreRecord`.
[[nodiscard]] Status commitRestoreData(DeviceFileSystem& files, Database& database, std::string_view identifier);
Status deleteRestoreRecord(Database::Session& session, std::string_view identifier);

/// `markRemoved` records that the data of a removed app, including kept data, must be deleted. `sweepRemoved` deletes
/// it; what it cannot delete is deleted when the device is next opened.
Status markRemoved(Database::Session& session, std::string_view identifier);
void sweepRemoved(DeviceFileSystem& files, Database& database, std::string_view identifier);

/// Deletes data that an interrupted process had marked as removed or not kept completely.
[[nodiscard]] Status recover(DeviceFileSystem& files, Database& database);

}  // namespace app_data

}  // namespace appsync::device
