#include "reporting/StoreMetadata.h"

#include "common/PropertyListFile.h"
#include "platform/SyncFiles.h"

namespace appsync {

std::optional<std::string> storeMetadataPath(const platform::AppRecord& app) {
  auto container = app.bundleContainerPath();
  if (!container) return std::nullopt;
  return container->append("/").append(kStoreMetadataName);
}

plist::Value readStoreMetadata(platform::FileSystem& files, const std::optional<std::string>& path) {
  if (!path) return {};
  const auto attributes = files.attributesOfItem(*path);
  if (!attributes || attributes->size > kMaximumMetadataBytes) return {};
  return readDictionary(files, path);
}

}  // namespace appsync
