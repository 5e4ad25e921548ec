// A host and a daemon that sync a platform of fakes, one asset at a time.
#pragma once

#include <map>
#include <ostream>
#include <string>
#include <string_view>
#include <vector>

#include "tests/faults/DaemonSync.h"

namespace appsync::test {

/// The file that lists packages waiting for their data.
inline constexpr std::string_view kRestoreStatePath = "/var/mobile/Library/ApplicationSync/RestoreState.plist";

/// One app of the device as the user sees it.
struct AppState {
  std::string identifier;
  std::string version;
  bool isInstalled = false;
  bool isPlaceholder = false;
  bool operator==(const AppState&) const = default;
};
std::ostream& operator<<(std::ostream& out, const AppState& state);

using DeviceState = std::vector<AppState>;

/// A sync with all kinds of events: new apps, an update, a removal, a denied assertion, an invalid package, transfers
/// that fail recoverably and unrecoverably, a restore whose data follows its package, and one whose package was parked
/// by an earlier sync (in coordinated mode both wait for the store). The order of all platform calls is the same in
/// every run.
class WholeSync {
 public:
  enum class Transfers { someFail, allArrive };

  explicit WholeSync(Mode mode);

  /// Runs a sync with a new client. The host requests the apps that the device lacks.
  void run(Transfers transfers);

  /// Restarts the device between two syncs.
  void restartDevice();

  [[nodiscard]] DeviceState deviceState() const;
  /// The operations in the last sync's todo list, by identifier.
  [[nodiscard]] std::map<std::string, std::string> todoOperations();
  /// The expected operations after a successful sync.
  [[nodiscard]] std::map<std::string, std::string> expectedTodoOperations() const;

  FakePlatform platform;

 private:
  void stage();
  [[nodiscard]] bool isWanted(const std::string& identifier, const std::string& version) const;

  const Mode mode_;
  std::map<std::string, std::string> requested_;
};

}  // namespace appsync::test
