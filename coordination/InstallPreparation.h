// One app's preparation for a coordinated install.
#pragma once

#include <optional>

#include "base/PropertyList.h"
#include "coordination/CoordinatedPreparation.h"
#include "core/PropertyListFile.h"
#include "platform/ZTAsset.h"

namespace appsync {

struct InstallPreparation : CoordinatedPreparation {
  const platform::ZTAsset& asset;
  const plist::Value* version = asset.variantOptions().find(platform::kAssetVersionKey);
  plist::Value info = readDictionary(platform.fileSystem(), asset.infoPlist());
  plist::Value store = readDictionary(platform.fileSystem(), asset.storePlist());

  std::optional<platform::StoreMetadata> storeMetadata = {};  ///< none when the coordinator had its options before
};

/// The last step: sees to it that the coordinator has a placeholder. True when it has.
bool providePlaceholder(InstallPreparation& preparation);

}  // namespace appsync
