// What a restored app's store metadata says of its placeholder.
#pragma once

#include <optional>
#include <string>

#include "common/PlugInLog.h"
#include "plist/PropertyList.h"

namespace appsync {

/// Said, at the level that suits, of store metadata that holds no dictionary.
inline constexpr PlugInLog::Format<std::string_view, Error> kRestoreMetadataUnreadable =
    "%s|failed to parse harvo metadata for '%{public}@'. err=%{public}@";

/// Typed questions to a dictionary that may hold anything: a text of another type reads as absent, a flag that gives no
/// boolean as false. Refers to the dictionary, which must stay as it is.
class RestoreMetadata {
 public:
  explicit RestoreMetadata(const plist::Dictionary& metadata) : metadata_(metadata) {}
  explicit RestoreMetadata(plist::Dictionary&&) = delete;

  [[nodiscard]] std::optional<std::string> displayName() const;
  /// A string, or null.
  [[nodiscard]] const plist::Value* bundleVersion() const;
  [[nodiscard]] bool isPeriodical() const;
  [[nodiscard]] bool isLaunchProhibited() const;

 private:
  const plist::Dictionary& metadata_;
};

}  // namespace appsync
