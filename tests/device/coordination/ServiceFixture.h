// Fixture with a device that installs through coordinators.
#pragma once

#include <chrono>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include <gtest/gtest.h>

#include "device/coordination/InstallCoordination.h"
#include "plist/PropertyList.h"
#include "tests/support/TestDevice.h"

namespace appsync::test {

inline constexpr platform::ClientIdentity kSync = platform::ClientIdentity::CXClientSync;
inline constexpr platform::ClientIdentity kStore = platform::ClientIdentity::CXClientBazaarly;

/// A reason for cancellations.
inline const Error kEnough{"Test", 7, "enough of it", nullptr};

/// Records reports as "placeholder com.a", "completed com.a", "completed com.a: why", "prioritize com.a",
/// "cancelled com.a by 2: why".
class RecordingDelegate final : public platform::InstallObserverDelegate {
 public:
  void coordinatorDidInstallPlaceholder(platform::InstallCoordinator& coordinator) override {
    note("placeholder", coordinator);
  }
  void coordinatorDidCompleteSuccessfully(platform::InstallCoordinator& coordinator) override {
    note("completed", coordinator);
  }
  void coordinatorShouldPrioritize(platform::InstallCoordinator& coordinator) override {
    note("prioritize", coordinator);
  }
  void coordinatorCanceledWithReason(platform::InstallCoordinator& coordinator, const Error& reason,
                                     platform::ClientIdentity client) override {
    EXPECT_EQ(coordinator.coordinatorError(), reason);
    add("cancelled " + *coordinator.bundleID() + " by " + std::to_string(static_cast<std::uint64_t>(client)) + ": " +
        reason.text);
  }

  [[nodiscard]] std::vector<std::string> reports() const {
    const std::lock_guard lock(mutex_);
    return reports_;
  }

 private:
  void note(const std::string& what, platform::InstallCoordinator& coordinator) {
    const auto error = coordinator.coordinatorError();
    add(what + ' ' + coordinator.bundleID().value_or("(none)") + (error ? ": " + error->text : ""));
  }
  void add(std::string line) {
    const std::lock_guard lock(mutex_);
    reports_.push_back(std::move(line));
  }

  mutable std::mutex mutex_;
  std::vector<std::string> reports_;
};

/// The operations of a client on coordinators.
class CoordinationClient {
 public:
  using Coordinator = std::shared_ptr<platform::InstallCoordinator>;
  using Kind = platform::CoordinatorKind;

  explicit CoordinationClient(TestDevice& device, platform::ClientIdentity identity = kSync)
      : device_(device), identity_(identity) {}

  [[nodiscard]] device::InstallCoordination& service() { return device_.services().installCoordination(); }

  [[nodiscard]] Coordinator find(std::string_view identifier, Kind kind = Kind::any) {
    return service().coordinatorForApp(kind, identifier, identity_, platform::IfMissing::findNothing, nullptr, nullptr);
  }
  [[nodiscard]] Coordinator make(std::string_view identifier, Kind kind = Kind::initiating) {
    return service().coordinatorForApp(kind, identifier, identity_, platform::IfMissing::create, nullptr, nullptr);
  }

  [[nodiscard]] std::shared_ptr<platform::PromisedTransferToPath> promise(std::string_view name) {
    return service().makePromisedTransferToPath(name, identity_, std::nullopt, 0);
  }
  /// Makes a placeholder with a complete configuration.
  [[nodiscard]] std::shared_ptr<platform::Placeholder> placeholder(
      std::string_view identifier, std::string_view name = "Notes",
      platform::TSInstallType type = platform::TSInstallType::Sync) {
    auto placeholder = service().initAppPlaceholder(name, identifier, type, identity_);
    platform::PlaceholderAttributes attributes;
    attributes.setBundleVersion("0.9");
    EXPECT_TRUE(placeholder->setPlaceholderAttributes(attributes).ok());
    EXPECT_TRUE(placeholder->setConfigurationComplete().ok());
    return placeholder;
  }

  [[nodiscard]] static platform::InstallOptions options(platform::TSInstallType type = platform::TSInstallType::Sync) {
    platform::InstallOptions options;
    options.setInstallType(type);
    options.setInstallTargetType(1);
    return options;
  }

  /// Returns a coordinator that lacks only its package, keeping what an existing one has.
  [[nodiscard]] Coordinator prepare(std::string_view identifier, Kind kind = Kind::initiating) {
    auto coordinator = make(identifier, kind);
    if (!coordinator->hasInstallOptions()) {
      EXPECT_TRUE(coordinator->setInstallOptions(options()).ok());
    }
    if (!coordinator->hasInitialODRAssetPromises()) {
      EXPECT_TRUE(coordinator->setInitialODRAssetPromises({}).ok());
    }
    if (!coordinator->hasAppAssetPromise()) {
      EXPECT_TRUE(coordinator->setAppAssetPromise(promise(std::string(identifier) + "-Asset")).ok());
    }
    if (!coordinator->hasPlaceholderPromise()) {
      EXPECT_TRUE(coordinator->setPlaceholderPromise(placeholder(identifier)).ok());
    }
    return coordinator;
  }

  static void deliver(const Coordinator& coordinator, const platform::FileLocation& package) {
    const auto promise = coordinator->appAssetPromise();
    promise->setTransferPath(package);
    promise->setPercentComplete(1);
    promise->setComplete(true);
  }

  /// Blocks until the service is idle.
  void settle() { ASSERT_TRUE(service().waitUntilIdle(std::chrono::minutes(5))); }

 private:
  TestDevice& device_;
  const platform::ClientIdentity identity_;
};

class CoordinationTest : public testing::Test {
 protected:
  using Kind = platform::CoordinatorKind;

  [[nodiscard]] device::InstallCoordination& service() { return client_.service(); }

  /// Writes a package to the staging folder.
  platform::FileLocation stage(std::string_view identifier, std::string_view version = "1.0") {
    return device_.stage(std::string(identifier) + ".zip", appPackage(identifier, version));
  }
  [[nodiscard]] bool exists(const platform::FileLocation& location) {
    return device_.files().fileExists(location.path);
  }
  /// Returns "1.0", "1.0 placeholder" for an app with a placeholder, or "none".
  [[nodiscard]] std::string state(std::string_view identifier) {
    const auto app = device_.record(identifier);
    if (app == nullptr) return "none";
    return app->bundleVersion().value_or("no version") + (app->isPlaceholder() ? " placeholder" : "");
  }
  [[nodiscard]] std::unique_ptr<platform::InstallObserver> listen(platform::InstallObserverDelegate& delegate) {
    return service().initWithMachServiceName("com.example.observer", {kSync}, delegate);
  }

  /// Returns the host path of the container of the app's bundle or placeholder.
  [[nodiscard]] std::string container(std::string_view identifier) {
    return device_.host(*device_.record(identifier)->bundleContainerPath());
  }
  [[nodiscard]] plist::Dictionary info(std::string_view identifier) {
    const auto read =
        plist::read(bytesOf(readHostFile(device_.host(*device_.record(identifier)->bundlePath()) + "/Info.plist")));
    return read && read->dictionary() != nullptr ? *read->dictionary() : plist::Dictionary();
  }
  [[nodiscard]] std::shared_ptr<platform::InstallProgress> progress(std::string_view identifier) {
    const auto app = device_.record(identifier);
    return app == nullptr ? nullptr : app->installProgress();
  }

  TestDevice device_{device::InstallMode::coordinated};
  CoordinationClient client_{device_};
  RecordingDelegate delegate_;
};

/// Returns the code of a failed operation.
[[nodiscard]] inline device::CoordinationFailure failureOf(const Status& status) {
  EXPECT_FALSE(status.ok());
  if (status.ok()) return {};
  EXPECT_EQ(status.error().domain, platform::kInstallCoordinationErrorDomain) << status.error().text;
  return static_cast<device::CoordinationFailure>(status.error().code);
}

}  // namespace appsync::test
