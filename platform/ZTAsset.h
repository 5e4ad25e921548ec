// The sync framework's record of one app package to transfer.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <utility>

#include "platform/FileLocation.h"
#include "plist/PropertyList.h"

namespace appsync::platform {

/// Parts of an asset: bits of the variant option "AssetParts" and of `completedAssetParts`.
inline constexpr std::uint32_t kZTAssetPartApplication = 1;
inline constexpr std::uint32_t kZTAssetPartApplicationData = 2;
inline constexpr std::uint32_t kZTAssetPartsAll = kZTAssetPartApplication | kZTAssetPartApplicationData;

/// Keys of `variantOptions`.
inline constexpr std::string_view kAssetVersionKey = "Version";
inline constexpr std::string_view kAssetPartsKey = "AssetParts";

/// An app package that the host is to send or has sent. Ownership is shared between plug-in and daemon. Not
/// thread-safe; only the plug-in may change an asset whose transfer was reported as ended.
///
/// Paths are device paths; fractions range from 0 to 1.
class ZTAsset {
 public:
  ZTAsset(std::string identifier, std::string dataclass, std::optional<std::string> prettyName)
      : identifier_(std::move(identifier)), dataclass_(std::move(dataclass)), prettyName_(std::move(prettyName)) {}
  virtual ~ZTAsset() = default;
  ZTAsset(const ZTAsset&) = delete;
  ZTAsset& operator=(const ZTAsset&) = delete;

  /// The app's bundle identifier.
  [[nodiscard]] const std::string& identifier() const { return identifier_; }
  [[nodiscard]] const std::string& dataclass() const { return dataclass_; }
  /// The name shown to the user.
  [[nodiscard]] const std::optional<std::string>& prettyName() const { return prettyName_; }

  /// Path of the received package. A relative path is relative to the public staging directory.
  [[nodiscard]] const std::optional<std::string>& path() const { return path_; }
  void setPath(std::optional<std::string> path) { path_ = std::move(path); }

  [[nodiscard]] const std::optional<FileLocation>& icon() const { return icon_; }
  void setIcon(std::optional<FileLocation> icon) { icon_ = std::move(icon); }

  /// Whether the asset belongs to a restore. The value may change between calls, because a daemon may reclassify an
  /// asset during its transfer.
  [[nodiscard]] virtual bool isRestore() const { return isRestore_; }
  void setIsRestore(bool isRestore) { isRestore_ = isRestore; }

  /// Whether the package is sent to the device, not from it.
  [[nodiscard]] bool isDownload() const { return isDownload_; }
  void setIsDownload(bool isDownload) { isDownload_ = isDownload; }

  /// The options "Version" and "AssetParts".
  [[nodiscard]] const plist::Dictionary& variantOptions() const { return variantOptions_; }
  void setVariantOptions(plist::Dictionary options) { variantOptions_ = std::move(options); }
  /// Returns the option "Version", of any type, or null if it is not set.
  [[nodiscard]] const plist::Value* version() const { return variantOptions_.find(kAssetVersionKey); }

  /// The parts that were received.
  [[nodiscard]] std::uint32_t completedAssetParts() const { return completedAssetParts_; }
  void setCompletedAssetParts(std::uint32_t parts) { completedAssetParts_ = parts; }

  /// Paths of the package's info and store-metadata property lists.
  [[nodiscard]] const std::optional<std::string>& infoPlist() const { return infoPlist_; }
  void setInfoPlist(std::optional<std::string> path) { infoPlist_ = std::move(path); }
  [[nodiscard]] const std::optional<std::string>& storePlist() const { return storePlist_; }
  void setStorePlist(std::optional<std::string> path) { storePlist_ = std::move(path); }

  /// The store's product identifier, or 0 if there is none.
  [[nodiscard]] std::int64_t storePID() const { return storePID_; }
  void setStorePID(std::int64_t productIdentifier) { storePID_ = productIdentifier; }

  [[nodiscard]] double downloadProgress() const { return downloadProgress_; }
  void setDownloadProgress(double fraction) { downloadProgress_ = fraction; }
  [[nodiscard]] double installProgress() const { return installProgress_; }
  void setInstallProgress(double fraction) { installProgress_ = fraction; }

  /// For logs.
  [[nodiscard]] std::string shortDescription() const { return dataclass_ + "/" + identifier_; }

 private:
  std::string identifier_;
  std::string dataclass_;
  std::optional<std::string> prettyName_;
  std::optional<std::string> path_;
  std::optional<FileLocation> icon_;
  bool isRestore_ = false;
  bool isDownload_ = false;
  plist::Dictionary variantOptions_;
  std::uint32_t completedAssetParts_ = 0;
  std::optional<std::string> infoPlist_;
  std::optional<std::string> storePlist_;
  std::int64_t storePID_ = 0;
  double downloadProgress_ = 0;
  double installProgress_ = 0;
};

}  // namespace appsync::platform
