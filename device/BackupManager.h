// Connections to the backup service.
#pragma once

#include <cstdint>
#include <string_view>

#include "base/Error.h"
#include "platform/BackupManager.h"

namespace appsync::device {

class Database;

/// Knows which apps' data a restore still keeps for them. All connections to one device see the same; it outlives the
/// process. Threads: any.
class BackupManager final : public platform::BackupManager {
 public:
  static constexpr const char* kSchema =
      "create table if not exists restore_data (identifier text primary key, size integer not null) without rowid;";

  /// `database` must outlive the connection.
  explicit BackupManager(Database& database) : database_(database) {}

  /// From now on a restore holds `size` bytes of data for the app.
  [[nodiscard]] Status keepRestoreData(std::string_view bundleIdentifier, std::uint64_t size);

  /// A device whose database cannot be read has no data for anyone.
  [[nodiscard]] bool restoreDataExists(std::string_view bundleIdentifier, std::uint64_t* size) override;
  bool cancelApplicationRestore(std::string_view bundleIdentifier, ErrorSlot error) override;

 private:
  Database& database_;
};

}  // namespace appsync::device
