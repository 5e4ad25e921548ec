// The home screen: its icon layout and its word on which apps may be replaced.
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "base/Bytes.h"
#include "device/services/Settings.h"
#include "platform/AppRegistry.h"
#include "platform/HomeScreenService.h"

namespace appsync::device {

class Database;

/// Icons stand where the layout puts them; apps that it does not name follow in the registry's order, which is that of
/// installation. The layout outlives the process.
///
/// A layout lists icons from the first place to the last, in pages or not: an array, or a dictionary with one under
/// "iconLists". In it stand, in any nesting:
///
///     a string                           one icon, by bundle identifier
///     an array                           a page or row: what is in it, one after the other
///     a dictionary with "iconLists"      a folder, whose icons stand in its place
///
/// Anything else in it is passed over, as is what is no bundle identifier and every repetition. Bytes that are no
/// property list, and layouts that name no icon, change nothing.
class HomeScreen final : public platform::HomeScreenService {
 public:
  static constexpr const char* kSchema =
      "create table if not exists icon_layout (position integer primary key, identifier text not null);";

  /// All must outlive the home screen.
  HomeScreen(Database& database, platform::AppRegistry& registry, Settings& settings)
      : database_(database), registry_(registry), settings_(settings) {}

  [[nodiscard]] Port blockableServerPort() override { return 1; }

  /// A layout that cannot be kept leaves the earlier one.
  void setIconState(Port port, ByteView layout) override;

  /// Identifiers of the layout keep their place whether their apps exist or not: a host lays out the apps that it is
  /// about to send, and asks for this order to send them by.
  [[nodiscard]] std::optional<Bytes> getFlattenedIconState(Port port, std::uint32_t format) override;

  /// Granted for what the registry has and not found for the rest, unless the settings answer for the app. Nothing on
  /// this device launches apps, so a granted assertion has nothing to hold back.
  [[nodiscard]] std::unique_ptr<platform::TerminationAssertion> terminationAssertionCreate(
      std::string_view bundleIdentifier, std::uint32_t reason, platform::TerminationAssertionOutcome& outcome) override;

  /// Every identifier in on-screen order, as `getFlattenedIconState` gives them.
  [[nodiscard]] Result<std::vector<std::string>> iconOrder();

 private:
  Database& database_;
  platform::AppRegistry& registry_;
  Settings& settings_;
};

}  // namespace appsync::device
