#include "restore/PlaceholderEnumeration.h"

#include "core/AppsClient.h"

namespace appsync {

namespace {

using platform::AppRecord;
using platform::BundleKind;
using platform::BundleRecord;

/// Returns the bundle's record, or null if it is not a placeholder app.
const AppRecord* asPlaceholder(const BundleRecord& bundle) {
  const AppRecord* record = bundle.asAppRecord();
  return record != nullptr && record->isPlaceholder() ? record : nullptr;
}

}  // namespace

IdentifierSet userBundles(platform::AppRegistry& registry) {
  IdentifierSet identifiers;
  registry.enumerateBundlesOfType(
      BundleKind::user, [&](const BundleRecord& bundle, bool&) { identifiers.insert(bundle.applicationIdentifier()); });
  return identifiers;
}

bool AppsClient::_placeholderExistsForApplication(std::string_view bundleIdentifier) {
  if (_useInstallCoordinator) return false;  // Placeholders belong to coordinators.
  bool found = false;
  _platform.defaultRegistry().enumerateBundlesOfType(BundleKind::user, [&](const BundleRecord& bundle, bool& stop) {
    found = found || bundle.applicationIdentifier() == bundleIdentifier;
    stop = found;
  });
  if (found) _log.message(kFoundPlaceholder, bundleIdentifier);
  return found;
}

void AppsClient::_enumeratePlaceholdersWithBlock(const PlaceholderVisitor& visit) {
  _platform.defaultRegistry().enumerateBundlesOfType(BundleKind::all, [&](const BundleRecord& bundle, bool& stop) {
    if (const AppRecord* record = asPlaceholder(bundle)) visit(*record, stop);
  });
}

IdentifierSet AppsClient::_getSystemAppPlaceholders() {
  IdentifierSet identifiers;
  _platform.defaultRegistry().enumerateBundlesOfType(BundleKind::system, [&](const BundleRecord& bundle, bool&) {
    if (const AppRecord* record = asPlaceholder(bundle)) identifiers.insert(record->applicationIdentifier());
  });
  _log.message("%s|SystemAppPlaceholders %{public}@", identifiers);
  return identifiers;
}

}  // namespace appsync
