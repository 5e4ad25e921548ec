// The backup service's list of demoted apps.
#pragma once

#include <optional>
#include <string_view>
#include <unordered_set>

#include "base/SeededHash.h"
#include "common/DemotionStatus.h"
#include "plist/PropertyList.h"

namespace appsync {

/// The lists of the demoted-apps file, indexed once for many look-ups.
class DemotedApps {
 public:
  /// If `lists` is nullopt, or an entry is not an array, no app counts as demoted.
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
  // Refer to `lists_`.
  const IdentifierViews automatically_;
  const IdentifierViews intentionally_;
};

}  // namespace appsync
