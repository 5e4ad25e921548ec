// One app that the device is to receive, as requested by the host or by an existing placeholder.
#pragma once

#include <functional>
#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <utility>

#include "platform/AppRecord.h"
#include "plist/PropertyList.h"

namespace appsync {

/// A dictionary with typed accessors. Its values are untrusted: one of the wrong type reads as absent, a flag that is
/// not a boolean as false.
class WantedEntry {
 public:
  /// Makes the entry of a placeholder on the device.
  [[nodiscard]] static WantedEntry fromPlaceholder(const platform::AppRecord& record);
  /// Makes the entry of a todo-list entry whose identifier is `identifier`.
  [[nodiscard]] static WantedEntry fromTodoEntry(const plist::Value& entry, std::string_view identifier);

  /// Returns empty text if a placeholder's record has no identifier.
  [[nodiscard]] std::string identifier() const;
  /// Returns the value from the host or the registry, or null.
  [[nodiscard]] const plist::Value* version() const;
  /// Returns the app's bundle, or the folder that the host staged for it.
  [[nodiscard]] std::optional<std::string> path() const;
  /// Returns the folder that contains artwork, info and store metadata.
  [[nodiscard]] std::optional<std::string> container() const;
  [[nodiscard]] std::optional<std::string> nameFromHost() const;
  [[nodiscard]] bool isRestore() const;
  [[nodiscard]] bool isIntentionallyDemoted() const;
  [[nodiscard]] bool isAutomaticallyDemoted() const;
  [[nodiscard]] bool isSystemApp() const;

  /// Returns the dictionary, for logs.
  [[nodiscard]] const plist::Value& values() const { return values_; }

 private:
  explicit WantedEntry(plist::Dictionary values) : values_(std::move(values)) {}

  plist::Value values_;
};

/// By bundle identifier.
using WantedEntries = std::map<std::string, WantedEntry, std::less<>>;

/// For logs: prints the dictionary of the entries' dictionaries.
struct DescribedEntries {
  const WantedEntries& entries;
};
void appendDescription(std::string& out, const DescribedEntries& described);

}  // namespace appsync
