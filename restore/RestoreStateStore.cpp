// Where restored packages lie, by app and version, across restarts of the daemon.
#include "common/PropertyListFile.h"
#include "common/RestoreState.h"
#include "core/AppsClient.h"
#include "plist/Access.h"

namespace appsync {

namespace {

constexpr std::string_view kRestoreStatePath = "/var/mobile/Library/ApplicationSync/RestoreState.plist";

/// The dictionary under `key`, made if there is none; null when something else is there.
plist::Dictionary* dictionaryUnder(plist::Dictionary& parent, std::string_view key) {
  if (!parent.contains(key)) parent.set(key, plist::Dictionary{});
  return parent.find(key)->dictionary();
}

}  // namespace

const plist::Value* restoreStateProperty(const plist::Value& root, std::string_view key, std::string_view identifier,
                                         const plist::Value* version) {
  const auto versionKey = stringIn(version);
  return versionKey ? plist::find(plist::find(root.find(identifier), *versionKey), key) : nullptr;
}

std::optional<plist::Value> AppsClient::_loadRestoreState() {
  const auto bytes = _platform.fileSystem().readFile(kRestoreStatePath);
  if (!bytes) return std::nullopt;
  auto root = plist::read(*bytes);
  return root ? std::move(root).value() : plist::Value();
}

std::optional<plist::Value> AppsClient::_restoreStatePropertyForKey(std::string_view key, std::string_view identifier,
                                                                    const plist::Value* version) {
  const auto root = _loadRestoreState();
  const plist::Value* property = root ? restoreStateProperty(*root, key, identifier, version) : nullptr;
  return property == nullptr ? std::nullopt : std::optional(*property);
}

void AppsClient::_setRestoreStatePropertyValue(const plist::Value& value, std::string_view key,
                                               std::string_view identifier, const plist::Value* version) {
  const auto versionKey = stringIn(version);
  if (!versionKey) return;
  plist::Value root = _loadRestoreState().value_or(plist::Dictionary{});

  plist::Dictionary* identifiers = root.dictionary();
  plist::Dictionary* versions = identifiers == nullptr ? nullptr : dictionaryUnder(*identifiers, identifier);
  plist::Dictionary* properties = versions == nullptr ? nullptr : dictionaryUnder(*versions, *versionKey);
  if (properties == nullptr) return;
  properties->set(key, value);
  writePropertyList(_platform.fileSystem(), kRestoreStatePath, root).ignore();
}

void AppsClient::cleanRestoreStateForIdentifier(std::string_view identifier) {
  auto root = _loadRestoreState();
  if (!root) return;
  plist::Dictionary* identifiers = root->dictionary();
  if (identifiers != nullptr) identifiers->erase(identifier);
  if (identifiers == nullptr || identifiers->empty()) {
    _platform.fileSystem().removeItem(kRestoreStatePath).ignore();
  } else {
    writePropertyList(_platform.fileSystem(), kRestoreStatePath, *root).ignore();
  }
}

}  // namespace appsync
