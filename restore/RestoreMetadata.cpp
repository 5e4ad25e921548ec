#include "restore/RestoreMetadata.h"

#include "common/PlaceholderBundle.h"
#include "plist/Access.h"

namespace appsync {

std::optional<std::string> RestoreMetadata::displayName() const {
  const auto title = ownedStringIn(metadata_.find("title"));
  return title ? title : ownedStringIn(metadata_.find("itemName"));
}

const plist::Value* RestoreMetadata::bundleVersion() const {
  const plist::Value* version = metadata_.find("bundleVersion");
  return stringIn(version) ? version : nullptr;
}

bool RestoreMetadata::isPeriodical() const {
  return booleanIn(metadata_.find(kPeriodicalKey));
}

bool RestoreMetadata::isLaunchProhibited() const {
  const plist::Value* flag = metadata_.find(kLaunchProhibitedKey);
  return booleanIn(flag != nullptr ? flag : metadata_.find("launchProhibited"));
}

}  // namespace appsync
