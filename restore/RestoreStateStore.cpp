#include "common/RestoreState.h"
#include "core/AppsClient.h"
#include "plist/Access.h"

namespace appsync {

std::optional<plist::Value> AppsClient::_restoreStatePropertyForKey(std::string_view key, std::string_view identifier,
                                                                    const plist::Value* version) {
  const RestoreState state(_platform.fileSystem());
  const plist::Value* property = state.property(key, identifier, version);
  return property == nullptr ? std::nullopt : std::optional(*property);
}

void AppsClient::_setRestoreStatePropertyValue(const plist::Value& value, std::string_view key,
                                               std::string_view identifier, const plist::Value* version) {
  if (!stringIn(version)) return;  // Checked first: the file need not be read.
  RestoreState(_platform.fileSystem()).setProperty(value, key, identifier, version);
}

void AppsClient::cleanRestoreStateForIdentifier(std::string_view identifier) {
  RestoreState(_platform.fileSystem()).erase(identifier);
}

}  // namespace appsync
