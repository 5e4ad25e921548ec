#include "common/RestoreState.h"

#include <utility>

#include "common/PropertyListFile.h"
#include "plist/Access.h"

namespace appsync {

namespace {

constexpr std::string_view kRestoreStatePath = "/var/mobile/Library/ApplicationSync/RestoreState.plist";

/// Returns the dictionary under `key`, inserted if the key is missing, or null if its value is not a dictionary.
plist::Dictionary* dictionaryUnder(plist::Dictionary& parent, std::string_view key) {
  if (!parent.contains(key)) parent.set(key, plist::Dictionary{});
  return parent.find(key)->dictionary();
}

}  // namespace

RestoreState::RestoreState(platform::FileSystem& files) : files_(files) {
  const auto bytes = files.readFile(kRestoreStatePath);
  fileExists_ = bytes.ok();
  if (!bytes) return;
  auto root = plist::read(*bytes);
  root_ = root ? std::move(root).value() : plist::Value();
}

const plist::Value* RestoreState::property(std::string_view key, std::string_view identifier,
                                           const plist::Value* version) const {
  const auto versionKey = stringIn(version);
  return versionKey ? plist::find(plist::find(root_.find(identifier), *versionKey), key) : nullptr;
}

void RestoreState::setProperty(const plist::Value& value, std::string_view key, std::string_view identifier,
                               const plist::Value* version) {
  const auto versionKey = stringIn(version);
  plist::Dictionary* identifiers = versionKey ? root_.dictionary() : nullptr;
  plist::Dictionary* versions = identifiers == nullptr ? nullptr : dictionaryUnder(*identifiers, identifier);
  plist::Dictionary* properties = versions == nullptr ? nullptr : dictionaryUnder(*versions, *versionKey);
  if (properties == nullptr) return;
  properties->set(key, value);
  writePropertyList(files_, kRestoreStatePath, root_).ignore();
}

void RestoreState::erase(std::string_view identifier) {
  if (!fileExists_) return;
  plist::Dictionary* identifiers = root_.dictionary();
  if (identifiers != nullptr) identifiers->erase(identifier);
  if (identifiers == nullptr || identifiers->empty()) {
    files_.removeItem(kRestoreStatePath).ignore();
  } else {
    writePropertyList(files_, kRestoreStatePath, root_).ignore();
  }
}

}  // namespace appsync
