// The device's settings, changed by users and read by services.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "base/Error.h"
#include "platform/ProfileConnection.h"

namespace appsync::device {

class Database;

/// Error domain of rejected settings.
inline constexpr std::string_view kSettingsDomain = "Settings";

/// The codes of errors in kSettingsDomain.
enum class SettingsFailure : long {
  unknownKey = 1,
  unknownValue,
  noAssignment,  ///< not of the form KEY=VALUE
};

/// The home screen's answer to a termination assertion.
enum class AssertionAnswer : std::uint8_t { granted, denied, unknown, failing };

/// The keys and their values:
///
///     app-installation   yes, no, unset      whether apps may be installed
///     app-removal        yes, no, unset      whether apps may be removed
///     coordination       on, off, unset      install through coordinators, from the next opening on; unset means off
///     store              a folder, or unset  packages of restored apps; stored as an absolute host path
///     assertion          ID:ANSWER           the home screen's answer for app ID, one setting per app: granted,
///                                            denied, unknown, failing, or unset for the default
///
/// Settings are stored in the device's database. Thread-safe. Errors: `kSettingsDomain`, with a text that lists the
/// accepted values, or the database's.
class Settings {
 public:
  static constexpr const char* kSchema =
      "create table if not exists settings (key text, item text, value text not null, primary key (key, item)) without rowid;";

  /// `database` must outlive the settings.
  explicit Settings(Database& database) : database_(database) {}

  /// Sets `key`. The value "unset" restores the default.
  [[nodiscard]] Status set(std::string_view key, std::string_view value);

  /// Sets a key from a text of the form "KEY=VALUE".
  [[nodiscard]] Status assign(std::string_view assignment);

  /// Sets the answer to assertions on the app.
  [[nodiscard]] Status setAssertionAnswer(std::string_view bundleIdentifier, AssertionAnswer answer);

  // For services. A setting that cannot be read counts as unset.

  [[nodiscard]] platform::RestrictionValue restriction(platform::RestrictionSetting setting);
  [[nodiscard]] bool coordinationIsOn();
  [[nodiscard]] std::optional<std::string> storeFolder();
  [[nodiscard]] std::optional<AssertionAnswer> assertionAnswer(std::string_view bundleIdentifier);

 private:
  /// Returns nullopt if the setting is unset or cannot be read.
  [[nodiscard]] std::optional<std::string> stored(std::string_view key, std::string_view item);

  Database& database_;
};

}  // namespace appsync::device
