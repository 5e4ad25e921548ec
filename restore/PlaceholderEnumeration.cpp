// Which apps on the device are placeholders.
#include "core/AppsClient.h"

namespace appsync {

namespace {

using platform::AppRecord;
using platform::BundleKind;
using platform::BundleRecord;

/// `bundle` as a placeholder app's record; null when it is anything else.
const AppRecord* asPlaceholder(const BundleRecord& bundle) {
  const AppRecord* record = bundle.asAppRecord();
  return record != nullptr && record->isPlaceholder() ? record : nullptr;
}

}  // namespace

bool AppsClient::_placeholderExistsForApplication(std::string_view bundleIdentifier, const Identifiers* userBundles) {
  if (_useInstallCoordinator) return false;  // Coordinators own the placeholders then.
  bool found = userBundles != nullptr && userBundles->contains(bundleIdentifier);
  if (userBundles == nullptr) {
    _platform.defaultRegistry().enumerateBundlesOfType(BundleKind::user, [&](const BundleRecord& bundle, bool& stop) {
      found = bundle.applicationIdentifier() == bundleIdentifier;
      stop = found;
    });
  }
  if (found) _log.message("%s|Found placeholder for bundle %{public}@", bundleIdentifier);
  return found;
}

Identifiers AppsClient::_userBundles() {
  Identifiers identifiers;
  _platform.defaultRegistry().enumerateBundlesOfType(
      BundleKind::user, [&](const BundleRecord& bundle, bool&) { identifiers.insert(bundle.applicationIdentifier()); });
  return identifiers;
}

void AppsClient::_enumeratePlaceholdersWithBlock(const PlaceholderVisitor& visit) {
  _platform.defaultRegistry().enumerateBundlesOfType(BundleKind::all, [&](const BundleRecord& bundle, bool& stop) {
    if (const AppRecord* record = asPlaceholder(bundle)) visit(*record, stop);
  });
}

Identifiers AppsClient::_getSystemAppPlaceholders() {
  Identifiers identifiers;
  _platform.defaultRegistry().enumerateBundlesOfType(BundleKind::system, [&](const BundleRecord& bundle, bool&) {
    if (const AppRecord* record = asPlaceholder(bundle)) identifiers.insert(record->applicationIdentifier());
  });
  _log.message("%s|SystemAppPlaceholders %{public}@", identifiers);
  return identifiers;
}

}  // namespace appsync
