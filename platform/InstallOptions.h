// Options of a coordinated install.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <utility>

#include "platform/InstallTypes.h"
#include "plist/PropertyList.h"

namespace appsync::platform {

/// The contents of an app's store metadata file. The service stores them with the installed app.
class StoreMetadata {
 public:
  [[nodiscard]] static StoreMetadata initWithDictionary(plist::Dictionary dictionary) {
    StoreMetadata metadata;
    metadata.dictionary_ = std::move(dictionary);
    return metadata;
  }

  [[nodiscard]] const plist::Dictionary& dictionary() const { return dictionary_; }

 private:
  plist::Dictionary dictionary_;
};

/// Set once for each coordinator, before its install begins. A plain value.
class InstallOptions {
 public:
  [[nodiscard]] const std::optional<StoreMetadata>& storeMetadata() const { return storeMetadata_; }
  void setStoreMetadata(std::optional<StoreMetadata> metadata) { storeMetadata_ = std::move(metadata); }

  /// The reason for the install.
  [[nodiscard]] TSInstallType installType() const { return installType_; }
  void setInstallType(TSInstallType type) { installType_ = type; }

  /// The target of the install, a number defined by the service, which only stores it.
  [[nodiscard]] std::uint64_t installTargetType() const { return installTargetType_; }
  void setInstallTargetType(std::uint64_t type) { installTargetType_ = type; }

 private:
  std::optional<StoreMetadata> storeMetadata_;
  TSInstallType installType_ = TSInstallType::None;
  std::uint64_t installTargetType_ = 0;
};

}  // namespace appsync::platform
