#include "host/RestoreInfo.h"

#include <cerrno>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <utility>

#include "platform/SyncFiles.h"

namespace appsync::host {
namespace {

/// Adds the keys that the sync client requires to the store metadata. Fails if the metadata is not a dictionary.
Result<Bytes> completed(const BackedUpApp& app, const std::optional<Bytes>& saved) {
  plist::Dictionary metadata;
  if (saved) {
    const Result<plist::Value> root = plist::read(*saved);
    if (!root) return root.error().in("its store metadata is damaged");
    if (root->dictionary() == nullptr) {
      return Error{std::string(domains::kPOSIX), EINVAL, "its store metadata is damaged: it is not a dictionary",
                   nullptr};
    }
    metadata = *root->dictionary();
  }
  if (metadata.find("title") == nullptr && metadata.find("itemName") == nullptr) {
    metadata.set("title", app.name.name.empty() ? app.name.identifier : app.name.name);
  }
  const bool lacksVersion = metadata.find("bundleVersion") == nullptr;
  if (lacksVersion || !app.name.version.empty()) metadata.set("bundleVersion", app.name.version);
  return plist::writeBinary(metadata);
}

}  // namespace

Result<plist::Dictionary> restoreInfoOf(const Backup& backup, const BackedUpApp& app) {
  plist::Dictionary entry;
  std::optional<Bytes> metadata;
  const auto read = [&](std::string_view name, const std::optional<std::uint64_t>& size, auto&& use) -> Status {
    if (!size) return {};
    Result<Bytes> bytes = readBackupFile(backup, app, name, *size);
    if (!bytes) return bytes.error();
    use(std::move(bytes).value());
    return {};
  };
  const auto addTo = [&entry](std::string_view key) {
    return [&entry, key](Bytes bytes) { entry.set(key, std::move(bytes)); };
  };
  Status done =
      read(backup_files::kStoreMetadata, app.storeMetadata, [&](Bytes bytes) { metadata = std::move(bytes); });
  if (done) done = read(backup_files::kLicence, app.licence, addTo(backup_files::kLicence));
  if (done) done = read(backup_files::kIcon, app.icon, addTo(backup_files::kIcon));
  if (!done) return done.error();
  Result<Bytes> document = completed(app, metadata);
  if (!document) return document.error();
  entry.set(restore_file::kMetadataKey, std::move(document).value());
  return entry;
}

}  // namespace appsync::host
