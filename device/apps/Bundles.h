// App bundles on the device's file system.
#pragma once

#include <memory>
#include <optional>
#include <string>

#include "platform/Bundle.h"
#include "platform/FileSystem.h"

namespace appsync::device {

/// Threads: any.
class Bundles final : public platform::Bundles {
 public:
  /// The main bundle's identifier in the process that sets up a restored device.
  static constexpr std::string_view kDataMigratorIdentifier = "com.corvel.datamigrator";

  /// `fileSystem` must outlive this. `mainBundleIdentifier` is whose process this is; a tool that plays the daemon
  /// leaves it as it is.
  explicit Bundles(platform::FileSystem& fileSystem,
                   std::optional<std::string> mainBundleIdentifier = std::string(platform::kDaemonBundleIdentifier))
      : fileSystem_(fileSystem), mainBundleIdentifier_(std::move(mainBundleIdentifier)) {}

  /// An "Info.plist" of more than `kMaximumMetadataBytes` counts as unusable.
  [[nodiscard]] std::unique_ptr<platform::Bundle> openBundle(const platform::FileLocation& location) override;

  [[nodiscard]] std::optional<std::string> mainBundleIdentifier() override { return mainBundleIdentifier_; }

  /// From now on the process counts as that one. Not beside other calls.
  void actAs(std::string mainBundleIdentifier) { mainBundleIdentifier_ = std::move(mainBundleIdentifier); }

 private:
  platform::FileSystem& fileSystem_;
  std::optional<std::string> mainBundleIdentifier_;
};

}  // namespace appsync::device
