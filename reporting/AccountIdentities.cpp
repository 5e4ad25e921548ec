// The store accounts that own the apps on the device.
#include "common/PropertyListFile.h"
#include "core/AppsClient.h"
#include "plist/Access.h"
#include "reporting/UserApps.h"

namespace appsync {

namespace {

using platform::AppRecord;
using Text = std::optional<std::string_view>;

/// A number is an integer or a real; a boolean is not a number.
enum class ExpectedType { string, number, dictionary };

bool isOfType(const plist::Value& value, ExpectedType type) {
  switch (type) {
    case ExpectedType::string:
      return value.type() == plist::Type::string;
    case ExpectedType::number:
      return value.type() == plist::Type::integer || value.type() == plist::Type::real;
    case ExpectedType::dictionary:
      return value.type() == plist::Type::dictionary;
  }
  return false;
}

/// Returns `value` if it has type `type`, else null. A value of another type is logged as an error under `label`; null
/// (missing) is not logged.
const plist::Value* typedLookup(const plist::Value* value, ExpectedType type, std::string_view label,
                                const PlugInLog& log) {
  if (value == nullptr || isOfType(*value, type)) return value;
  log.lookupError("unexpected type for %{public}@", label);
  return nullptr;
}

/// The account in one app's store metadata. A value of a wrong type is logged at each look-up.
class AccountMetadata {
 public:
  AccountMetadata(platform::FileSystem& files, const AppRecord& app, const PlugInLog& log)
      : path_(storeMetadataPath(app)), root_(readDictionary(files, path_)), log_(log) {}

  [[nodiscard]] const std::optional<std::string>& path() const { return path_; }

  /// The identifier in its older place.
  [[nodiscard]] Text olderIdentifier() const { return text(root_.find("corvelId"), "corvelID"); }

  /// The dictionary about the account, with the identifier's newer place; may be null.
  [[nodiscard]] const plist::Value* account() const {
    const plist::Value* download = root_.find("com.corvel.HarvoStore.downloadInfo");
    return dictionary(plist::find(dictionary(download, "downloadInfo"), "accountInfo"), "accountInfo");
  }

  // Of what `account` gave.

  [[nodiscard]] Text newerIdentifier(const plist::Value* account) const { return textIn(account, "CorvelID"); }
  [[nodiscard]] std::optional<plist::Value> personIdentifier(const plist::Value* account) const {
    constexpr std::string_view kKey = "DSPersonID";
    const plist::Value* number = typedLookup(plist::find(account, kKey), ExpectedType::number, kKey, log_);
    return number == nullptr ? std::nullopt : std::optional(*number);
  }
  [[nodiscard]] Text alternativeIdentifier(const plist::Value* account) const { return textIn(account, "AltDSID"); }

 private:
  [[nodiscard]] const plist::Value* dictionary(const plist::Value* value, std::string_view label) const {
    return typedLookup(value, ExpectedType::dictionary, label, log_);
  }
  [[nodiscard]] Text text(const plist::Value* value, std::string_view label) const {
    return stringIn(typedLookup(value, ExpectedType::string, label, log_));
  }
  [[nodiscard]] Text textIn(const plist::Value* account, std::string_view key) const {
    return text(plist::find(account, key), key);
  }

  const std::optional<std::string> path_;
  const plist::Value root_;
  const PlugInLog& log_;
};

void addIdentifiers(std::set<std::string>& identifiers, const AppRecord& app, const AccountMetadata& metadata,
                    const PlugInLog& log) {
  const Text older = metadata.olderIdentifier();
  const Text newer = metadata.newerIdentifier(metadata.account());
  if (!older && !newer) {
    log.message("%s|unknown CorvelID for %{public}@ (plist at %{public}@)", app.applicationIdentifier(),
                metadata.path());
  } else if (older && newer && older != newer) {
    log.message("%s|mismatched CorvelID keys for %{public}@: %{public}@ vs %{public}@", app.applicationIdentifier(),
                *older, *newer);
  }
  if (older) identifiers.emplace(*older);
  if (newer) identifiers.emplace(*newer);
}

void addAccount(platform::ZTAccountInfos& accounts, const AccountMetadata& metadata) {
  const plist::Value* const account = metadata.account();
  Text identifier = metadata.newerIdentifier(account);
  if (!identifier) identifier = metadata.olderIdentifier();
  if (!identifier || accounts.contains(*identifier)) return;
  platform::ZTMutableAccountInfo info;
  info.setDSID(metadata.personIdentifier(account));
  info.setCorvelID(std::string(*identifier));
  info.setAltDSID(std::optional<std::string>(metadata.alternativeIdentifier(account)));
  accounts.insert(std::move(info));
}

}  // namespace

std::set<std::string> AppsClient::corvelIDsForAssets() {
  _log.message("%s|getting id's for assets");
  std::set<std::string> identifiers;
  visitUserApps(_platform.defaultRegistry(), [&](const AppRecord& app) {
    addIdentifiers(identifiers, app, AccountMetadata(_platform.fileSystem(), app, _log), _log);
  });
  _log.message("%s|Returning corvel ID set: %{public}@", identifiers);
  return identifiers;
}

platform::ZTAccountInfos AppsClient::accountsForAssets() {
  _log.message("%s|getting accounts for assets");
  platform::ZTAccountInfos accounts;
  visitUserApps(_platform.defaultRegistry(), [&](const AppRecord& app) {
    addAccount(accounts, AccountMetadata(_platform.fileSystem(), app, _log));
  });
  _log.message("%s|Returning accountInfo: %{public}@", accounts);
  return accounts;
}

}  // namespace appsync
