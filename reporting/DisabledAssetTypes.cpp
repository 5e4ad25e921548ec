// Which dataclasses a device's restrictions leave nothing to do for.
#include "core/AppsClient.h"
#include "platform/SyncFiles.h"

namespace appsync {

std::optional<std::set<std::string>> AppsClient::disabledAssetTypes() {
  if (_appInstallationAllowed()) return std::nullopt;
  if (_appRemovalAllowed()) return std::nullopt;
  return std::set{std::string(kApplicationDataclass)};
}

}  // namespace appsync
