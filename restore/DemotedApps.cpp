#include "restore/DemotedApps.h"

#include <utility>

#include "core/AppsClient.h"
#include "platform/SyncFiles.h"
#include "plist/Access.h"

namespace appsync {

DemotedApps::DemotedApps(std::optional<plist::Dictionary> lists)
    : lists_(std::move(lists)),
      automatically_(identifiersUnder(demoted_apps::kAutomaticKey)),
      intentionally_(identifiersUnder(demoted_apps::kIntentionalKey)) {}

DemotedApps::IdentifierViews DemotedApps::identifiersUnder(std::string_view key) const {
  const plist::Value* list = lists_ ? lists_->find(key) : nullptr;
  const plist::Array* entries = list == nullptr ? nullptr : list->array();
  IdentifierViews identifiers;
  if (entries == nullptr) return identifiers;
  identifiers.reserve(entries->size());
  for (const plist::Value& entry : *entries) {
    if (const auto identifier = stringIn(&entry)) identifiers.insert(*identifier);
  }
  return identifiers;
}

DemotionStatus DemotedApps::statusOf(std::string_view bundleIdentifier) const {
  if (automatically_.contains(bundleIdentifier)) return DemotionStatus::automaticallyDemoted;
  if (intentionally_.contains(bundleIdentifier)) return DemotionStatus::intentionallyDemoted;
  return DemotionStatus::notDemoted;
}

std::optional<plist::Dictionary> AppsClient::_loadDemotedAppsPlist(platform::Platform& platform, std::string_view path,
                                                                   ErrorSlot error) {
  auto bytes = platform.fileSystem().readFile(path);
  if (!bytes) {
    setError(error, bytes.error());
    return std::nullopt;
  }
  if (bytes->empty()) return std::nullopt;

  const PlugInLog log(platform.syncFramework());
  auto root = plist::read(std::move(bytes).value());
  if (!root) {
    log.error("%s|couldn't parse demoted apps list");
    return std::nullopt;
  }
  plist::Dictionary* lists = root->dictionary();
  if (lists == nullptr) {
    log.error("%s|demoted apps list is not a dictionary");
    return std::nullopt;
  }
  return std::move(*lists);
}

}  // namespace appsync
