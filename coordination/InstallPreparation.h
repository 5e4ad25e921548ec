// One app's preparation for a coordinated install.
#pragma once

#include <optional>

#include "coordination/Preparation.h"
#include "platform/ZTAsset.h"
#include "plist/PropertyList.h"

namespace appsync {

struct InstallPreparation : CoordinatedPreparation {
  const platform::ZTAsset& asset;
  // What the host says of the app, each null when it does not.
  plist::Value info;
  plist::Value store;

  std::optional<platform::StoreMetadata> storeMetadata = {};  ///< none when the coordinator had its options before
};

/// The last step: sees to it that the coordinator has a placeholder. True when it has.
bool providePlaceholder(InstallPreparation& preparation);

}  // namespace appsync
