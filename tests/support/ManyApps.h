// A device with as many apps as one likes, none of which costs anything.
#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <utility>

#include "kit/fakes/FakeFileSystem.h"
#include "kit/fakes/FakePlatform.h"
#include "platform/AppRegistry.h"
#include "platform/Keys.h"

namespace appsync::test {

/// A registry that knows no app and takes whatever it is asked to install. A base for those that measure.
class NoApps : public platform::AppRegistry {
 public:
  void addObserver(platform::AppRegistryObserver&) override {}
  void removeObserver(platform::AppRegistryObserver&) override {}
  [[nodiscard]] bool applicationIsInstalled(std::string_view) override { return false; }
  [[nodiscard]] std::shared_ptr<const platform::AppRecord> recordForIdentifier(std::string_view,
                                                                               platform::PlaceholderLookup) override {
    return nullptr;
  }
  void enumerateBundlesOfType(platform::BundleKind,
                              const std::function<void(const platform::BundleRecord& bundle, bool& stop)>&) override {}
  [[nodiscard]] Status installApplication(const platform::FileLocation&, const plist::Dictionary&) override {
    return {};
  }
  [[nodiscard]] Status uninstallApplication(std::string_view, const plist::Dictionary&) override { return {}; }
  [[nodiscard]] std::shared_ptr<platform::InstallProgress> installProgressForApplication(
      const platform::AppRecord&, platform::TSInstallPhase) override {
    return nullptr;
  }
  void installPhaseFinishedForProgress(platform::InstallProgress&) override {}
};

/// An installed user app of 1000 bytes that is told by its number.
class NumberedApp final : public platform::AppRecord {
 public:
  explicit NumberedApp(std::int64_t number) : identifier_("com.example.app" + std::to_string(1'000'000 + number)) {}

  [[nodiscard]] std::string applicationIdentifier() const override { return identifier_; }
  [[nodiscard]] std::string description() const override { return identifier_; }
  [[nodiscard]] std::optional<std::string> bundleIdentifier() const override { return identifier_; }
  [[nodiscard]] std::optional<std::string> bundleVersion() const override { return std::nullopt; }
  [[nodiscard]] std::optional<std::string> bundleContainerPath() const override { return "/var/apps/" + identifier_; }
  [[nodiscard]] std::optional<std::string> bundlePath() const override { return std::nullopt; }
  [[nodiscard]] std::string applicationType() const override { return std::string(platform::kApplicationTypeUser); }
  [[nodiscard]] std::uint64_t staticDiskUsage() const override { return 1000; }
  [[nodiscard]] platform::TSInstallType installType() const override { return platform::TSInstallType::None; }
  [[nodiscard]] bool isInstalled() const override { return true; }
  [[nodiscard]] bool isPlaceholder() const override { return false; }
  [[nodiscard]] bool hasMIDBasedSINF() const override { return false; }
  [[nodiscard]] std::shared_ptr<platform::InstallProgress> installProgress() const override { return nullptr; }

 private:
  const std::string identifier_;
};

/// Makes each app's record for its visit alone.
class ManyApps final : public NoApps {
 public:
  explicit ManyApps(std::int64_t count) : count_(count) {}

  void enumerateBundlesOfType(
      platform::BundleKind,
      const std::function<void(const platform::BundleRecord& bundle, bool& stop)>& visit) override {
    bool stop = false;
    for (std::int64_t number = 0; number < count_ && !stop; ++number)
      visit(NumberedApp(number), stop);
  }

 private:
  const std::int64_t count_;
};

/// Files that all hold the same, whatever is written.
class SameFileEverywhere final : public FakeFileSystem {
 public:
  SameFileEverywhere(CallJournal& journal, Bytes content) : FakeFileSystem(journal), content_(std::move(content)) {}

  [[nodiscard]] Result<platform::FileAttributes> attributesOfItem(std::string_view) override {
    return platform::FileAttributes{content_.size(), false};
  }
  [[nodiscard]] Result<Bytes> readFile(std::string_view) override {
    ++reads;
    return content_;
  }
  [[nodiscard]] Status writeFileAtomically(std::string_view, ByteView) override {
    ++writes;
    return {};
  }

  [[nodiscard]] std::size_t size() const { return content_.size(); }

  std::int64_t reads = 0;
  std::int64_t writes = 0;

 private:
  const Bytes content_;
};

/// A device of that many apps, whose files all hold the same and whose log nobody reads.
struct DeviceOfManyApps {
  DeviceOfManyApps(std::int64_t apps, Bytes everyFile) : registry(apps), files(platform.journal, std::move(everyFile)) {
    platform.use(registry);
    platform.use(files);
    platform.log.disable(8);
  }

  FakePlatform platform;
  ManyApps registry;
  SameFileEverywhere files;
};

}  // namespace appsync::test
