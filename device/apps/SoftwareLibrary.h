// The store's library of receipts.
#pragma once

#include <functional>
#include <optional>
#include <string>
#include <vector>

#include "base/Error.h"
#include "platform/AppRegistry.h"
#include "platform/SoftwareLibrary.h"

namespace appsync::device {

class Database;

/// The receipt of an installed app.
struct Receipt {
  std::string bundleIdentifier;
  std::optional<std::string> version;
  bool operator==(const Receipt&) const = default;
};

/// Stores a receipt for each installed user app. Thread-safe.
class SoftwareLibrary final : public platform::SoftwareLibrary {
 public:
  static constexpr const char* kSchema =
      "create table if not exists receipts (identifier text primary key, version text) without rowid;";

  /// Both arguments must outlive the connection.
  SoftwareLibrary(Database& database, platform::AppRegistry& registry) : database_(database), registry_(registry) {}

  /// Replaces all receipts, or none if it fails. Calls `completion` on the calling thread before it returns.
  void refreshReceipts(std::function<void(const std::optional<Error>& error)> completion) override;

  /// Returns the receipts of the last refresh, ordered by identifier.
  [[nodiscard]] Result<std::vector<Receipt>> receipts();

 private:
  [[nodiscard]] Status replaceReceipts();

  Database& database_;
  platform::AppRegistry& registry_;
};

}  // namespace appsync::device
