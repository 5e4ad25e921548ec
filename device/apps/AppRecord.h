// The registry's record of an app.
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <string_view>

#include "device/apps/AppTable.h"
#include "platform/AppRecord.h"

namespace appsync::device {

/// Device path of the directory of bundle containers.
inline constexpr std::string_view kContainersPath = "/var/mobile/Containers/Bundle";

/// For an app with both bundles, paths, name, version and size are those of the installed bundle; the install type is
/// that of the placeholder. Immutable except for the progress.
class AppRecord final : public platform::AppRecord {
 public:
  AppRecord(AppRow row, std::shared_ptr<platform::InstallProgress> progress)
      : row_(std::move(row)), progress_(std::move(progress)) {}

  [[nodiscard]] std::string applicationIdentifier() const override { return row_.identifier; }
  [[nodiscard]] std::optional<std::string> bundleIdentifier() const override { return row_.identifier; }
  [[nodiscard]] std::optional<std::string> bundleVersion() const override;
  [[nodiscard]] std::optional<std::string> bundleContainerPath() const override;
  [[nodiscard]] std::optional<std::string> bundlePath() const override;
  [[nodiscard]] std::string applicationType() const override { return row_.applicationType; }
  /// Returns the size of all files in the container, in bytes.
  [[nodiscard]] std::uint64_t staticDiskUsage() const override;
  [[nodiscard]] platform::TSInstallType installType() const override;
  [[nodiscard]] bool isInstalled() const override { return row_.installed.has_value(); }
  [[nodiscard]] bool isPlaceholder() const override { return row_.placeholder.has_value(); }
  [[nodiscard]] bool hasMIDBasedSINF() const override { return row_.hasDeviceBoundLicence; }
  [[nodiscard]] std::shared_ptr<platform::InstallProgress> installProgress() const override { return progress_; }
  /// "com.example.notes 1.2 (installed, placeholder)"
  [[nodiscard]] std::string description() const override;

  /// Returns the name for users, or the identifier of an app without a bundle.
  [[nodiscard]] std::string name() const;
  /// Returns seconds since 1970, or nullopt for an app without a bundle.
  [[nodiscard]] std::optional<double> installedAt() const;

 private:
  [[nodiscard]] const StoredBundle* bundle() const;

  AppRow row_;
  std::shared_ptr<platform::InstallProgress> progress_;
};

}  // namespace appsync::device
