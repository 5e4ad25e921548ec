// The backup service's list of demoted apps.
#pragma once

#include <optional>
#include <string_view>
#include <unordered_set>

#include "base/SeededHash.h"
#include "common/DemotionStatus.h"
#include "plist/PropertyList.h"

namespace appsync {

/// Kept by the device's backup service: a dictionary of two arrays of bundle identifiers.
inline constexpr std::string_view kDemotedAppsPath =
    "/var/mobile/Library/Preferences/com.corvel.Vaultory.DemotedApps.plist";

/// Answers for many apps after one walk of the lists.
class DemotedApps {
 public:
  /// Without a dictionary, or for a list that is none, nothing is demoted.
  explicit DemotedApps(std::optional<plist::Dictionary> lists);
  DemotedApps(const DemotedApps&) = delete;
  DemotedApps& operator=(const DemotedApps&) = delete;

  [[nodiscard]] DemotionStatus statusOf(std::string_view bundleIdentifier) const;

  /// As read, for logs.
  [[nodiscard]] const std::optional<plist::Dictionary>& lists() const { return lists_; }

 private:
  using IdentifierViews = std::unordered_set<std::string_view, SeededHash>;

  [[nodiscard]] IdentifierViews identifiersUnder(std::string_view key) const;

  const std::optional<plist::Dictionary> lists_;
  // Refer to the lists.
  const IdentifierViews automatically_;
  const IdentifierViews intentionally_;
};

}  // namespace appsync
