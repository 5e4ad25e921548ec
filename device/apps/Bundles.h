// App bundles on the device's file system.
#pragma once

#include <memory>
#include <optional>
#include <string>

#include "platform/Bundle.h"
#include "platform/FileSystem.h"

namespace appsync::device {

/// Thread-safe.
class Bundles final : public platform::Bundles {
 public:
  /// The main bundle identifier of the process that sets up a restored device.
  static constexpr std::string_view kDataMigratorIdentifier = "com.corvel.datamigrator";

  /// `fileSystem` must outlive this object. `mainBundleIdentifier` identifies the process.
  explicit Bundles(platform::FileSystem& fileSystem,
                   std::optional<std::string> mainBundleIdentifier = std::string(platform::kDaemonBundleIdentifier))
      : fileSystem_(fileSystem), mainBundleIdentifier_(std::move(mainBundleIdentifier)) {}

  /// An "Info.plist" of more than `kMaximumMetadataBytes` is ignored.
  [[nodiscard]] std::unique_ptr<platform::Bundle> openBundle(const platform::FileLocation& location) override;

  [[nodiscard]] std::optional<std::string> mainBundleIdentifier() override { return mainBundleIdentifier_; }

  /// Changes the main bundle identifier. Not thread-safe.
  void actAs(std::string mainBundleIdentifier) { mainBundleIdentifier_ = std::move(mainBundleIdentifier); }

 private:
  platform::FileSystem& fileSystem_;
  std::optional<std::string> mainBundleIdentifier_;
};

}  // namespace appsync::device
