// The validated options of an install.
#pragma once

#include <functional>
#include <optional>
#include <string>

#include "base/Bytes.h"
#include "base/Error.h"
#include "device/apps/AppTable.h"
#include "plist/PropertyList.h"

namespace appsync::device {

/// Additional statements for the install's or removal's transaction. If one fails, the transaction is rolled back.
using TransactionHook = std::function<void(Database::Session& session)>;

/// The install options and the additions of other services of the device.
struct InstallRequest {
  BundleRole role = BundleRole::installed;
  std::string identifier;
  std::optional<platform::TSInstallType> installType;
  std::optional<Bytes> storeMetadata;
  std::optional<Bytes> licenceData;
  /// Store metadata for a package without it.
  std::optional<Bytes> defaultStoreMetadata;
  /// May be empty.
  TransactionHook transactionHook;
};

/// Validates install options, ignoring unknown keys. Errors: platform::kInstallerErrorDomain.
[[nodiscard]] Result<InstallRequest> readInstallOptions(const plist::Dictionary& options);

}  // namespace appsync::device
