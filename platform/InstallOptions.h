// How an app is to be installed.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <utility>

#include "platform/InstallTypes.h"
#include "plist/PropertyList.h"

namespace appsync::platform {

/// What the store says of an app, as its metadata file has it. The service keeps it with the installed app.
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

/// What a coordinator is told once, before its install begins.
class InstallOptions {
 public:
  [[nodiscard]] const std::optional<StoreMetadata>& storeMetadata() const { return storeMetadata_; }
  void setStoreMetadata(std::optional<StoreMetadata> metadata) { storeMetadata_ = std::move(metadata); }

  /// Why the app is installed.
  [[nodiscard]] TSInstallType installType() const { return installType_; }
  void setInstallType(TSInstallType type) { installType_ = type; }

  /// What the app is installed into, in the service's own numbering. It is kept, and shown to whoever asks.
  [[nodiscard]] std::uint64_t installTargetType() const { return installTargetType_; }
  void setInstallTargetType(std::uint64_t type) { installTargetType_ = type; }

 private:
  std::optional<StoreMetadata> storeMetadata_;
  TSInstallType installType_ = TSInstallType::None;
  std::uint64_t installTargetType_ = 0;
};

}  // namespace appsync::platform
