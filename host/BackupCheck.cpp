#include "host/BackupCheck.h"

#include <cerrno>
#include <cstdint>
#include <filesystem>
#include <optional>
#include <string_view>
#include <system_error>
#include <utility>

#include "base/ReturnIfError.h"
#include "host/RestoreInfo.h"
#include "plist/DictionaryStream.h"

namespace appsync::host {
namespace {

namespace fs = std::filesystem;

Error damage(std::string text) {
  return {std::string(domains::kPOSIX), EINVAL, std::move(text), nullptr};
}

/// Returns the size of all files in a folder, links not followed.
Result<std::uint64_t> sizeOfFiles(const std::string& folder) {
  std::uint64_t size = 0;
  std::error_code failure;
  fs::recursive_directory_iterator entry(folder, failure);
  while (!failure && entry != fs::recursive_directory_iterator()) {
    if (fs::is_regular_file(entry->symlink_status(failure))) size += entry->file_size(failure);
    if (!failure) entry.increment(failure);
  }
  if (failure) return Error::fromErrno(failure.value(), folder);
  return size;
}

Status checkData(const Backup& backup, const BackedUpApp& app) {
  if (!app.data) return {};
  const Result<std::uint64_t> size = sizeOfFiles(dataFolderIn(backup, app));
  if (!size) return size.error();
  if (*size == *app.data) return {};
  return damage("the data of " + app.name.identifier + " has " + std::to_string(*size) + " bytes and must have " +
                std::to_string(*app.data));
}

Status checkFile(const Backup& backup, const BackedUpApp& app, std::string_view name,
                 const std::optional<std::uint64_t>& size) {
  if (!size) return {};
  const Result<Bytes> bytes = readBackupFile(backup, app, name, *size);
  return bytes ? Status() : Status(bytes.error());
}

Status checkApp(const Backup& backup, const BackedUpApp& app) {
  if (!app.damage.empty()) return damage(app.damage);
  Status sound = checkFile(backup, app, backup_files::kStoreMetadata, app.storeMetadata);
  if (sound) sound = checkFile(backup, app, backup_files::kLicence, app.licence);
  if (sound) sound = checkFile(backup, app, backup_files::kIcon, app.icon);
  return sound ? checkData(backup, app) : sound;
}

Status checkRestoreFile(const Backup& backup) {
  plist::Dictionary entries;
  for (const BackedUpApp& app : backup.apps) {
    Result<plist::Dictionary> info = restoreInfoOf(backup, app);
    if (info) entries.set(app.name.identifier, std::move(info).value());
  }
  Result<Bytes> document = plist::writeBinary(entries);
  if (!document) return document.error();
  const auto readable = plist::DictionaryStream::open(std::move(document).value());
  return readable ? Status() : Status(readable.error());
}

}  // namespace

Status checkBackup(const std::string& path, const Backup& written) {
  const Result<Backup> backup = readBackup(path);
  if (!backup) return backup.error();
  if (manifestOf(*backup) != manifestOf(written)) return damage("its manifest differs from what was written");
  for (const BackedUpApp& app : backup->apps) {
    RETURN_IF_ERROR(checkApp(*backup, app));
  }
  return checkRestoreFile(*backup);
}

}  // namespace appsync::host
