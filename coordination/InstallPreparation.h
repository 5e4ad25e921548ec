// One app's preparation for a coordinated install, as its steps hand it on.
#pragma once

#include <memory>
#include <optional>
#include <string>

#include "base/Error.h"
#include "base/PropertyList.h"
#include "core/PlugInLog.h"
#include "core/PropertyListFile.h"
#include "platform/Platform.h"
#include "platform/ZTAsset.h"

namespace appsync {

class AppsClient;

/// What a preparation works on, and what it holds so far.
struct InstallPreparation {
  AppsClient& client;
  platform::Platform& platform;
  const PlugInLog& log;
  const platform::ZTAsset& asset;
  const std::string& identifier = asset.identifier();
  const plist::Value* version = asset.variantOptions().find(platform::kAssetVersionKey);
  plist::Value info = readDictionary(platform.fileSystem(), asset.infoPlist());
  plist::Value store = readDictionary(platform.fileSystem(), asset.storePlist());

  std::shared_ptr<platform::InstallCoordinator> coordinator = nullptr;
  std::optional<platform::StoreMetadata> storeMetadata = {};     ///< none when the coordinator had its options before
  std::shared_ptr<platform::Placeholder> placeholder = nullptr;  ///< as long as it is not the coordinator's
  std::optional<Error> error = {};                               ///< the last one

  /// Notes how a step went, and says it. Returns whether it went well.
  bool concluded(const Status& outcome, PlugInLog::Format<std::string> done,
                 PlugInLog::Format<Error, std::string> failed) {
    if (outcome) {
      log.message(done, identifier);
    } else {
      error = outcome.error();
      log.error(failed, outcome.error(), identifier);
    }
    return outcome.ok();
  }
};

/// The last step: sees to it that the coordinator has a placeholder. True when it has.
bool providePlaceholder(InstallPreparation& preparation);

}  // namespace appsync
