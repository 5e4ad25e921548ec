#include "reporting/UserApps.h"

#include "platform/SyncFiles.h"

namespace appsync {

std::optional<std::string> storeMetadataPath(const platform::AppRecord& app) {
  auto container = app.bundleContainerPath();
  if (!container) return std::nullopt;
  return container->append("/").append(kStoreMetadataName);
}

}  // namespace appsync
