// Connections to the store's library.
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

/// What the library knows of one installed app.
struct Receipt {
  std::string bundleIdentifier;
  std::optional<std::string> version;
  bool operator==(const Receipt&) const = default;
};

/// Keeps a receipt for every user app that is installed. Threads: any.
class SoftwareLibrary final : public platform::SoftwareLibrary {
 public:
  static constexpr const char* kSchema =
      "create table if not exists receipts (identifier text primary key, version text) without rowid;";

  /// Both must outlive the connection.
  SoftwareLibrary(Database& database, platform::AppRegistry& registry) : database_(database), registry_(registry) {}

  /// Replaces all receipts, or none if it fails. `completion` runs on the calling thread before this returns.
  void refreshReceipts(std::function<void(const std::optional<Error>& error)> completion) override;

  /// The receipts of the last refresh, by identifier.
  [[nodiscard]] Result<std::vector<Receipt>> receipts();

 private:
  [[nodiscard]] Status replaceReceipts();

  Database& database_;
  platform::AppRegistry& registry_;
};

}  // namespace appsync::device
