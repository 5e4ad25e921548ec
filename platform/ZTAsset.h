// The sync framework's record of one application package to transfer.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <utility>

#include "platform/FileLocation.h"
#include "plist/PropertyList.h"

namespace appsync::platform {

/// Parts of an asset, as bits in the variant option "AssetParts" and in `completedAssetParts`.
inline constexpr std::uint32_t kZTAssetPartApplication = 1;
inline constexpr std::uint32_t kZTAssetPartApplicationData = 2;
inline constexpr std::uint32_t kZTAssetPartsAll = kZTAssetPartApplication | kZTAssetPartApplicationData;

/// Keys of `variantOptions`.
inline constexpr std::string_view kAssetVersionKey = "Version";
inline constexpr std::string_view kAssetPartsKey = "AssetParts";

/// One application package that the host is to send, or has sent. Shared between plug-in and daemon; one thread at a
/// time may change it, and after a transfer was reported as ended only the plug-in does.
///
/// All paths are device paths; fractions run from 0 to 1.
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
  /// The name to show to people.
  [[nodiscard]] const std::optional<std::string>& prettyName() const { return prettyName_; }

  /// The received package. A relative path is relative to the public staging folder.
  [[nodiscard]] const std::optional<std::string>& path() const { return path_; }
  void setPath(std::optional<std::string> path) { path_ = std::move(path); }

  [[nodiscard]] const std::optional<FileLocation>& icon() const { return icon_; }
  void setIcon(std::optional<FileLocation> icon) { icon_ = std::move(icon); }

  /// Whether the asset belongs to a restore. A daemon that reclassifies assets while they are on their way may answer
  /// differently from one call to the next.
  [[nodiscard]] virtual bool isRestore() const { return isRestore_; }
  void setIsRestore(bool isRestore) { isRestore_ = isRestore; }

  /// Whether the package comes to the device (rather than leaving it).
  [[nodiscard]] bool isDownload() const { return isDownload_; }
  void setIsDownload(bool isDownload) { isDownload_ = isDownload; }

  /// "Version" and "AssetParts".
  [[nodiscard]] const plist::Dictionary& variantOptions() const { return variantOptions_; }
  void setVariantOptions(plist::Dictionary options) { variantOptions_ = std::move(options); }
  /// The first of them, of whichever type it was given; null when there is none.
  [[nodiscard]] const plist::Value* version() const { return variantOptions_.find(kAssetVersionKey); }

  /// The parts that have arrived.
  [[nodiscard]] std::uint32_t completedAssetParts() const { return completedAssetParts_; }
  void setCompletedAssetParts(std::uint32_t parts) { completedAssetParts_ = parts; }

  /// Paths of the package's info and store-metadata property lists.
  [[nodiscard]] const std::optional<std::string>& infoPlist() const { return infoPlist_; }
  void setInfoPlist(std::optional<std::string> path) { infoPlist_ = std::move(path); }
  [[nodiscard]] const std::optional<std::string>& storePlist() const { return storePlist_; }
  void setStorePlist(std::optional<std::string> path) { storePlist_ = std::move(path); }

  /// The store's product identifier; 0 when there is none.
  [[nodiscard]] std::int64_t storePID() const { return storePID_; }
  void setStorePID(std::int64_t productIdentifier) { storePID_ = productIdentifier; }

  [[nodiscard]] double downloadProgress() const { return downloadProgress_; }
  void setDownloadProgress(double fraction) { downloadProgress_ = fraction; }
  [[nodiscard]] double installProgress() const { return installProgress_; }
  void setInstallProgress(double fraction) { installProgress_ = fraction; }

  /// The asset in a few words, for logs.
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
