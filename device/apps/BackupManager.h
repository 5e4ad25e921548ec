// The backup service, which keeps restored data.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "base/Error.h"
#include "device/apps/AppData.h"
#include "platform/BackupManager.h"

namespace appsync::device {

/// Keeps restored data until its apps are installed. All connections to a device share the data, which is stored in the
/// device. Thread-safe.
class BackupManager final : public platform::BackupManager {
 public:
  static constexpr const char* kSchema = app_data::kSchema;

  /// `database` and `files` must outlive the connection.
  BackupManager(Database& database, DeviceFileSystem& files) : database_(database), files_(files) {}

  /// Keeps a copy of a host directory for the app; see `app_data::keep`.
  [[nodiscard]] Status keepRestoreData(std::string_view bundleIdentifier, const std::string& hostFolder);

  /// Moves the kept data to the container of a demoted app, for which no package is expected.
  [[nodiscard]] Status restoreDataNow(std::string_view bundleIdentifier);

  /// Returns false if the database cannot be read.
  [[nodiscard]] bool restoreDataExists(std::string_view bundleIdentifier, std::uint64_t* size) override;
  bool cancelApplicationRestore(std::string_view bundleIdentifier, ErrorSlot error) override;

 private:
  Database& database_;
  DeviceFileSystem& files_;
};

}  // namespace appsync::device
