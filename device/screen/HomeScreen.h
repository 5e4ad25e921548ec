// The home screen: the icon layout and termination assertions.
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

/// The icons of the layout come first, in its order, then the other apps in the registry's order, which is the order of
/// installation. The layout is stored in the device's database. Thread-safe.
///
/// A layout is an array, or a dictionary with an array under "iconLists". Arrays contain, nested in any way:
///
///     a string                           an icon's bundle identifier
///     an array                           a page or row
///     a dictionary with "iconLists"      a folder, replaced by its icons
///
/// Other values, invalid bundle identifiers and repetitions are ignored. Bytes that are not a property list, and
/// layouts without an icon, change nothing.
class HomeScreen final : public platform::HomeScreenService {
 public:
  static constexpr const char* kSchema =
      "create table if not exists icon_layout (position integer primary key, identifier text not null);";

  /// All arguments must outlive the home screen.
  HomeScreen(Database& database, platform::AppRegistry& registry, Settings& settings)
      : database_(database), registry_(registry), settings_(settings) {}

  [[nodiscard]] Port blockableServerPort() override { return 1; }

  /// If the layout cannot be stored, the earlier one remains.
  void setIconState(Port port, ByteView layout) override;

  /// Includes the identifiers of apps that do not exist: a host lays out the apps that it is about to send and reads
  /// this order to send them by.
  [[nodiscard]] std::optional<Bytes> getFlattenedIconState(Port port, std::uint32_t format) override;

  /// Grants assertions on apps of the registry and reports others as not found, unless the setting "assertion" has an
  /// answer for the app. A granted assertion has no effect, because this device never launches apps.
  [[nodiscard]] std::unique_ptr<platform::TerminationAssertion> terminationAssertionCreate(
      std::string_view bundleIdentifier, std::uint32_t reason, platform::TerminationAssertionOutcome& outcome) override;

  /// Returns the identifiers that `getFlattenedIconState` encodes.
  [[nodiscard]] Result<std::vector<std::string>> iconOrder();

 private:
  Database& database_;
  platform::AppRegistry& registry_;
  Settings& settings_;
};

}  // namespace appsync::device
