// Apps and records of the fake registry.
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <utility>

#include "kit/fakes/FakeInstallProgress.h"
#include "platform/AppRecord.h"
#include "plist/PropertyList.h"

namespace appsync::test {

/// One app of the registry. Created by one of the factories, then modified:
/// `FakeApp::placeholder("com.a").ofType(kApplicationTypeSystem).withVersion("2")`.
struct FakeApp {
  std::string identifier;
  std::optional<std::string> bundleIdentifier;
  std::optional<std::string> version;
  std::optional<std::string> containerPath;
  std::optional<std::string> bundlePath;
  std::string applicationType;
  /// The kind of enumeration that visits it; nullopt derives it from the type.
  std::optional<platform::BundleKind> kind;
  std::uint64_t staticDiskUsage = 0;
  platform::TSInstallType installType = platform::TSInstallType::None;
  bool isInstalled = false;
  bool isPlaceholder = false;
  /// Whether the licence data is bound to this device.
  bool hasMIDBasedSINF = false;
  /// Null if no install is running.
  std::shared_ptr<FakeInstallProgress> progress;
  /// Options of the latest install.
  plist::Dictionary installOptions;

  /// Returns a user app, version "1.0", in "/var/mobile/Containers/Bundle/<identifier>", neither installed nor
  /// placeholder.
  explicit FakeApp(std::string appIdentifier);

  [[nodiscard]] static FakeApp installed(std::string identifier);
  /// Adds a progress with state Waiting and phase Loading.
  [[nodiscard]] static FakeApp placeholder(std::string identifier,
                                           platform::TSInstallType type = platform::TSInstallType::Sync);
  /// Returns an installed app that also has a placeholder of a later version.
  [[nodiscard]] static FakeApp updating(std::string identifier,
                                        platform::TSInstallType type = platform::TSInstallType::Sync);

  [[nodiscard]] FakeApp withBundleIdentifier(std::optional<std::string> value) const;
  [[nodiscard]] FakeApp withVersion(std::optional<std::string> value) const;
  [[nodiscard]] FakeApp withContainerPath(std::optional<std::string> value) const;
  [[nodiscard]] FakeApp withBundlePath(std::optional<std::string> value) const;
  [[nodiscard]] FakeApp ofType(std::string_view type) const;
  /// For registries with more application types than kinds of bundles.
  [[nodiscard]] FakeApp metByWalksOf(platform::BundleKind kind) const;
  [[nodiscard]] FakeApp withStaticDiskUsage(std::uint64_t bytes) const;
  [[nodiscard]] FakeApp withInstallType(platform::TSInstallType type) const;
  [[nodiscard]] FakeApp withMIDBasedSINF() const;
  [[nodiscard]] FakeApp withProgress(platform::TSInstallState state, platform::TSInstallPhase phase) const;
  [[nodiscard]] FakeApp withoutProgress() const;
};

/// A snapshot of an app. Described as "<identifier>".
class FakeAppRecord final : public platform::AppRecord {
 public:
  explicit FakeAppRecord(FakeApp app) : app_(std::move(app)) {}

  [[nodiscard]] std::string applicationIdentifier() const override { return app_.identifier; }
  [[nodiscard]] std::string description() const override { return app_.identifier; }
  [[nodiscard]] std::optional<std::string> bundleIdentifier() const override { return app_.bundleIdentifier; }
  [[nodiscard]] std::optional<std::string> bundleVersion() const override { return app_.version; }
  [[nodiscard]] std::optional<std::string> bundleContainerPath() const override { return app_.containerPath; }
  [[nodiscard]] std::optional<std::string> bundlePath() const override { return app_.bundlePath; }
  [[nodiscard]] std::string applicationType() const override { return app_.applicationType; }
  [[nodiscard]] std::uint64_t staticDiskUsage() const override { return app_.staticDiskUsage; }
  [[nodiscard]] platform::TSInstallType installType() const override { return app_.installType; }
  [[nodiscard]] bool isInstalled() const override { return app_.isInstalled; }
  [[nodiscard]] bool isPlaceholder() const override { return app_.isPlaceholder; }
  [[nodiscard]] bool hasMIDBasedSINF() const override { return app_.hasMIDBasedSINF; }
  [[nodiscard]] std::shared_ptr<platform::InstallProgress> installProgress() const override { return app_.progress; }

 private:
  FakeApp app_;
};

/// A bundle that is not an app.
class FakeBundleRecord final : public platform::BundleRecord {
 public:
  explicit FakeBundleRecord(std::string identifier) : identifier_(std::move(identifier)) {}

  [[nodiscard]] std::string applicationIdentifier() const override { return identifier_; }
  [[nodiscard]] std::string description() const override { return identifier_; }

 private:
  std::string identifier_;
};

}  // namespace appsync::test
