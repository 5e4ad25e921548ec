// The host's state of a device, kept from one sync to the next.
#pragma once

#include <set>
#include <string>
#include <string_view>

#include "base/Error.h"

namespace appsync::host {

using IdentifierSet = std::set<std::string, std::less<>>;

/// The apps that the host must not send again, because the device discards its list of deleted apps at the end of each
/// sync. Stored in the device's folder as "host-state.plist", a dictionary of two arrays of identifiers.
struct HostState {
  /// "Declined": removed by the device's user or on request; not sent again unless requested.
  IdentifierSet declined;
  /// "Offered": sent to the device and not known to have been installed. The installer of a failed update may remove
  /// the app's old version; such an app does not count as deleted by its user.
  IdentifierSet offered;

  /// Adds the apps that the device reports as deleted to `declined`, except those in `offered`.
  void addDeleted(const IdentifierSet& deleted);

  bool operator==(const HostState&) const = default;
};

/// Reads the state from a device's folder; a missing file is an empty state. Fails if the file cannot be read or
/// parsed, because a sync without it would reinstall removed apps. The error's text names the file and says what to do.
[[nodiscard]] Result<HostState> loadHostState(const std::string& devicePath);
/// Replaces the file atomically.
[[nodiscard]] Status saveHostState(const std::string& devicePath, const HostState& state);
/// Removes the file. Succeeds if there is no file.
[[nodiscard]] Status removeHostState(const std::string& devicePath);

}  // namespace appsync::host
