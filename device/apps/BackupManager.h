// Connections to the backup service.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "base/Error.h"
#include "device/apps/AppData.h"
#include "platform/BackupManager.h"

namespace appsync::device {

/// Keeps the data that a restore brought until its apps are there. All connections to one device see the same; it
/// outlives the process. Threads: any.
class BackupManager final : public platform::BackupManager {
 public:
  static constexpr const char* kSchema = app_data::kSchema;

  /// Both must outlive the connection.
  BackupManager(Database& database, DeviceFileSystem& files) : database_(database), files_(files) {}

  /// From now on a restore holds a copy of that folder of this machine for the app; see `app_data::keep`.
  [[nodiscard]] Status keepRestoreData(std::string_view bundleIdentifier, const std::string& hostFolder);

  /// Gives the data to an app whose package does not come, because it is demoted.
  [[nodiscard]] Status restoreDataNow(std::string_view bundleIdentifier);

  /// A device whose database cannot be read has no data for anyone.
  [[nodiscard]] bool restoreDataExists(std::string_view bundleIdentifier, std::uint64_t* size) override;
  bool cancelApplicationRestore(std::string_view bundleIdentifier, ErrorSlot error) override;

 private:
  Database& database_;
  DeviceFileSystem& files_;
};

}  // namespace appsync::device
