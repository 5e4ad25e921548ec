#include "transfer/WantedEntry.h"

#include "platform/Keys.h"
#include "platform/SyncFiles.h"
#include "plist/Access.h"

namespace appsync {

namespace {

constexpr std::string_view kContainer = "Container";
constexpr std::string_view kPath = "Path";
constexpr std::string_view kIsRestore = "IsRestore";
constexpr std::string_view kIntentionallyDemoted = "intentional_demoted_app";
constexpr std::string_view kAutomaticallyDemoted = "auto_demoted_app";
constexpr std::string_view kSystemApp = "system_app";
constexpr std::string_view kNameFromHost = "NameFromHarvo";

void setIfPresent(plist::Dictionary& values, std::string_view key, const std::optional<std::string>& value) {
  if (value) values.set(key, *value);
}

int flag(bool isSet) {
  return isSet ? 1 : 0;
}

}  // namespace

WantedEntry WantedEntry::fromPlaceholder(const platform::AppRecord& record) {
  using platform::TSInstallType;
  const TSInstallType type = record.installType();
  plist::Dictionary values{{kIsRestore, flag(type == TSInstallType::Restore)},
                           {kIntentionallyDemoted, flag(type == TSInstallType::IntentionalDowngrade)},
                           {kAutomaticallyDemoted, flag(type == TSInstallType::Downgrade)},
                           {kSystemApp, record.applicationType() == platform::kApplicationTypeSystem}};
  setIfPresent(values, platform::kBundleVersionKey, record.bundleVersion());
  setIfPresent(values, platform::BundleIdentifierKey, record.bundleIdentifier());
  setIfPresent(values, kContainer, record.bundleContainerPath());
  setIfPresent(values, kPath, record.bundlePath());
  return WantedEntry(std::move(values));
}

WantedEntry WantedEntry::fromTodoEntry(const plist::Value& entry, std::string_view identifier) {
  const std::string staged = std::string(kWorkArea) + "/" + std::string(identifier);
  plist::Dictionary values{{platform::BundleIdentifierKey, identifier}, {kContainer, staged}, {kPath, staged}};
  if (const plist::Value* version = entry.find(todo::kVersion)) values.set(platform::kBundleVersionKey, *version);
  if (const plist::Value* name = entry.find(todo::kName)) values.set(kNameFromHost, *name);
  return WantedEntry(std::move(values));
}

std::string WantedEntry::identifier() const {
  return ownedStringIn(values_.find(platform::BundleIdentifierKey)).value_or("");
}

const plist::Value* WantedEntry::version() const {
  return values_.find(platform::kBundleVersionKey);
}

std::optional<std::string> WantedEntry::path() const {
  return ownedStringIn(values_.find(kPath));
}

std::optional<std::string> WantedEntry::container() const {
  return ownedStringIn(values_.find(kContainer));
}

std::optional<std::string> WantedEntry::nameFromHost() const {
  return ownedStringIn(values_.find(kNameFromHost));
}

bool WantedEntry::isRestore() const {
  return booleanIn(values_.find(kIsRestore));
}

bool WantedEntry::isIntentionallyDemoted() const {
  return booleanIn(values_.find(kIntentionallyDemoted));
}

bool WantedEntry::isAutomaticallyDemoted() const {
  return booleanIn(values_.find(kAutomaticallyDemoted));
}

bool WantedEntry::isSystemApp() const {
  return booleanIn(values_.find(kSystemApp));
}

void appendDescription(std::string& out, const DescribedEntries& described) {
  plist::Dictionary dictionary;
  for (const auto& [identifier, entry] : described.entries)
    dictionary.set(identifier, entry.values());
  appendDescription(out, plist::Value(std::move(dictionary)));
}

}  // namespace appsync
