// One app that the device is to get, as the host or an existing placeholder asks for it.
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

/// A dictionary with typed questions. What it was made from may hold anything: a value of the wrong type reads as
/// absent, a flag that gives no boolean as false.
class WantedEntry {
 public:
  /// For a placeholder that is on the device already.
  [[nodiscard]] static WantedEntry fromPlaceholder(const platform::AppRecord& record);
  /// For an entry of the host's todo list whose identifier is `identifier`.
  [[nodiscard]] static WantedEntry fromTodoEntry(const plist::Value& entry, std::string_view identifier);

  /// Empty when a placeholder's record has none.
  [[nodiscard]] std::string identifier() const;
  /// As the host or the registry gave it; null when there is none.
  [[nodiscard]] const plist::Value* version() const;
  /// The app's bundle, or the folder that the host staged for it.
  [[nodiscard]] std::optional<std::string> path() const;
  /// The folder in which artwork, info and store metadata lie.
  [[nodiscard]] std::optional<std::string> container() const;
  [[nodiscard]] std::optional<std::string> nameFromHost() const;
  [[nodiscard]] bool isRestore() const;
  [[nodiscard]] bool isIntentionallyDemoted() const;
  [[nodiscard]] bool isAutomaticallyDemoted() const;
  [[nodiscard]] bool isSystemApp() const;

  /// The dictionary itself, for logs.
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
