// The device's settings, which people change and services read.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "base/Error.h"
#include "platform/ProfileConnection.h"

namespace appsync::device {

class Database;

/// Error domain of refused settings.
inline constexpr std::string_view kSettingsDomain = "Settings";

/// The codes of errors in kSettingsDomain.
enum class SettingsFailure : long {
  unknownKey = 1,
  unknownValue,
  noAssignment,  ///< a text that is not KEY=VALUE
};

/// What the home screen answers when it is asked to hold an app.
enum class AssertionAnswer : std::uint8_t { granted, denied, unknown, failing };

/// The keys, and the values each takes:
///
///     app-installation   yes, no, unset      may apps be installed
///     app-removal        yes, no, unset      may apps be removed
///     coordination       on, off, unset      install through coordinators, from the next opening on; unset is off
///     store              a folder, or unset  where packages of restored apps come from; kept as an absolute host path
///     assertion          ID:ANSWER           what the home screen answers for app ID, one setting per app: granted,
///                                            denied, unknown, failing, or unset for its own judgement
///
/// Settings are kept with the device and outlive the process. Threads: any.
/// Errors: `kSettingsDomain`, with a text that says what would have done; else the database's own.
class Settings {
 public:
  static constexpr const char* kSchema =
      "create table if not exists settings (key text, item text, value text not null, primary key (key, item)) without rowid;";

  /// `database` must outlive the settings.
  explicit Settings(Database& database) : database_(database) {}

  /// Sets `key`. The value "unset" returns it to what it is without being set.
  [[nodiscard]] Status set(std::string_view key, std::string_view value);

  /// The same with "KEY=VALUE" in one text.
  [[nodiscard]] Status assign(std::string_view assignment);

  /// Answers assertions on that app with `answer` from now on.
  [[nodiscard]] Status setAssertionAnswer(std::string_view bundleIdentifier, AssertionAnswer answer);

  // For services. A setting that cannot be read counts as unset.

  [[nodiscard]] platform::RestrictionValue restriction(platform::RestrictionSetting setting);
  [[nodiscard]] bool coordinationIsOn();
  [[nodiscard]] std::optional<std::string> storeFolder();
  [[nodiscard]] std::optional<AssertionAnswer> assertionAnswer(std::string_view bundleIdentifier);

 private:
  /// Absent when it is unset or cannot be read.
  [[nodiscard]] std::optional<std::string> stored(std::string_view key, std::string_view item);

  Database& database_;
};

}  // namespace appsync::device
