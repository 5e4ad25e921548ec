// What the host remembers about a device from one sync to the next.
#pragma once

#include <set>
#include <string>
#include <string_view>

#include "base/Error.h"

namespace appsync::host {

using IdentifierSet = std::set<std::string, std::less<>>;

/// The device forgets at the end of a sync which apps its user deleted, so the host has to remember. A value; it is
/// kept in the device's folder as "host-state.plist", a dictionary of two arrays of identifiers.
struct HostState {
  /// "Declined": removed by the device's user or on request; not sent again unless asked for.
  IdentifierSet declined;
  /// "Offered": sent to the device and not known to have been installed. When an install fails, the installer may
  /// remove the app's old version: that it is gone is then not its user's wish.
  IdentifierSet offered;

  /// Learns which apps the device reports as deleted, before it is told to forget them.
  void learnDeleted(const IdentifierSet& deleted);

  bool operator==(const HostState&) const = default;
};

/// The state kept in a device's folder; an empty one when there is none. One that cannot be read or understood is an
/// error: who went on without it would bring back what was removed. The text names the file and says what to do.
[[nodiscard]] Result<HostState> loadHostState(const std::string& devicePath);
/// Replaces it in one step.
[[nodiscard]] Status saveHostState(const std::string& devicePath, const HostState& state);
/// Forgets everything. Nothing kept is a success.
[[nodiscard]] Status removeHostState(const std::string& devicePath);

}  // namespace appsync::host
