// The store metadata of a restored app, as far as its placeholder needs it.
#pragma once

#include <optional>
#include <string>

#include "common/PlugInLog.h"
#include "plist/PropertyList.h"

namespace appsync {

/// Logged, as a message or an error, if the store metadata is not a dictionary.
inline constexpr PlugInLog::Format<std::string_view, Error> kRestoreMetadataUnreadable =
    "%s|failed to parse harvo metadata for '%{public}@'. err=%{public}@";

/// Typed accessors of an untrusted dictionary: a text of another type reads as absent, a flag that is not a boolean as
/// false. Refers to the dictionary, which must not change.
class RestoreMetadata {
 public:
  explicit RestoreMetadata(const plist::Dictionary& metadata) : metadata_(metadata) {}
  explicit RestoreMetadata(plist::Dictionary&&) = delete;

  [[nodiscard]] std::optional<std::string> displayName() const;
  /// Returns a string, or null.
  [[nodiscard]] const plist::Value* bundleVersion() const;
  [[nodiscard]] bool isPeriodical() const;
  [[nodiscard]] bool isLaunchProhibited() const;

 private:
  const plist::Dictionary& metadata_;
};

}  // namespace appsync
