// A host and a daemon that sync a device of fakes, one asset at a time.
#pragma once

#include <map>
#include <ostream>
#include <string>
#include <string_view>
#include <vector>

#include "tests/faults/DaemonSync.h"

namespace appsync::test {

/// Where packages that wait for their data are noted.
inline constexpr std::string_view kRestoreStatePath = "/var/mobile/Library/ApplicationSync/RestoreState.plist";

/// One app of the device as a person would see it.
struct AppState {
  std::string identifier;
  std::string version;
  bool isInstalled = false;
  bool isPlaceholder = false;
  bool operator==(const AppState&) const = default;
};
std::ostream& operator<<(std::ostream& out, const AppState& state);

using DeviceState = std::vector<AppState>;

/// A device on which everything happens that a sync knows: new apps, an update, a removal, a denied assertion, a
/// package that no installer takes, transfers that fail for now and for good, a restore whose data follows its package
/// and one whose package was parked by an earlier sync (under coordination both are the store's, and wait for it). The
/// order of all platform calls is the same in every run.
class WholeSync {
 public:
  enum class Transfers { someFail, allArrive };

  explicit WholeSync(Mode mode);

  /// From the making of the client to its end. The host asks for what the device lacks, as it finds it.
  void run(Transfers transfers);

  /// Between two syncs: what a device does when it starts again.
  void restartDevice();

  [[nodiscard]] DeviceState deviceState() const;
  /// By identifier, of the last sync's todo list.
  [[nodiscard]] std::map<std::string, std::string> todoWords();
  /// What the words are when the last sync went well.
  [[nodiscard]] std::map<std::string, std::string> expectedTodoWords() const;

  FakePlatform platform;

 private:
  void stage();
  [[nodiscard]] bool isWanted(const std::string& identifier, const std::string& version) const;

  const Mode mode_;
  std::map<std::string, std::string> asked_;
};

}  // namespace appsync::test
