// What an install was asked to do.
#pragma once

#include <functional>
#include <optional>
#include <string>

#include "base/Bytes.h"
#include "base/Error.h"
#include "device/apps/AppTable.h"
#include "plist/PropertyList.h"

namespace appsync::device {

/// Runs in the transaction that records what an install or removal did; a statement of it that fails makes that fail.
using TransactionHook = std::function<void(Database::Session& session)>;

/// The install options, each checked, and what other services of the device add.
struct InstallRequest {
  BundleRole role = BundleRole::installed;
  std::string identifier;
  std::optional<platform::TSInstallType> installType;
  std::optional<Bytes> storeMetadata;
  std::optional<Bytes> licenceData;
  /// Store metadata for a package that has none of its own.
  std::optional<Bytes> defaultStoreMetadata;
  /// May be empty.
  TransactionHook transactionHook;
};

/// Keys that installing does not know are passed over. Errors: platform::kInstallerErrorDomain.
[[nodiscard]] Result<InstallRequest> readInstallOptions(const plist::Dictionary& options);

}  // namespace appsync::device
