// Coordinators, placeholders and promises of the fake service.
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "base/Bytes.h"
#include "base/Error.h"
#include "platform/InstallCoordinator.h"

namespace appsync::test {

/// A cancellation: its client and reason.
struct FakeCancellation {
  Error reason;
  platform::ClientIdentity client = platform::ClientIdentity::CXClientSync;
  bool operator==(const FakeCancellation&) const = default;
};

enum class FakePromiseKind : std::uint8_t { transferToPath, outOfBand };

struct FakePromise {
  FakePromiseKind kind = FakePromiseKind::transferToPath;
  std::string name;
  platform::ClientIdentity client = platform::ClientIdentity::CXClientSync;
  std::uint64_t diskSpaceNeeded = 0;
  std::optional<platform::FileLocation> transferPath;
  double percentComplete = 0;
  bool isComplete = false;
  /// Whether it is or was attached to a coordinator or placeholder.
  bool isAttached = false;
  /// Whether the app is being installed with it.
  bool isTaken = false;
  /// Whether the coordinator or placeholder that it is attached to has ended.
  bool hasEnded = false;
  std::optional<FakeCancellation> cancellation;
};

struct FakePlaceholder {
  std::string bundleName;
  std::string identifier;
  platform::TSInstallType installType = platform::TSInstallType::Sync;
  platform::ClientIdentity client = platform::ClientIdentity::CXClientSync;
  std::shared_ptr<FakePromise> icon;
  std::optional<platform::PlaceholderAttributes> attributes;
  /// The outer nullopt means that it was not set.
  std::optional<std::optional<platform::StoreMetadata>> metadata;
  std::optional<Bytes> sinfData;
  bool isConfigured = false;
  /// Whether it belongs or belonged to a coordinator.
  bool isAttached = false;
  /// Whether the home screen shows it.
  bool isShown = false;
  std::optional<FakeCancellation> cancellation;
};

enum class FakeCoordinatorStage : std::uint8_t { waiting, installing, ended };

/// Progress of showing a placeholder on the home screen.
enum class FakeShowing : std::uint8_t { notBegun, underWay, over };

/// One coordinator. Created by `of`, then modified: `FakeCoordinator::of("com.a",
/// CoordinatorKind::updating).madeBy(ClientIdentity::CXClientBazaarly)`.
struct FakeCoordinator {
  std::string identifier;
  platform::CoordinatorKind kind = platform::CoordinatorKind::initiating;
  platform::ClientIdentity creator = platform::ClientIdentity::CXClientSync;
  /// Whether `bundleID` returns nullopt.
  bool hasLostIdentifier = false;
  FakeCoordinatorStage stage = FakeCoordinatorStage::waiting;
  std::optional<Error> error;
  std::optional<FakeCancellation> cancellation;
  std::weak_ptr<platform::InstallObserverDelegate> observer;
  std::optional<platform::InstallOptions> options;
  /// nullopt if not set; empty if set to an empty list.
  std::optional<std::vector<std::shared_ptr<FakePromise>>> initialODRAssets;
  std::shared_ptr<FakePromise> appAsset;
  std::optional<platform::ClientIdentity> responsibleClient;
  std::shared_ptr<FakePromise> userData;
  std::shared_ptr<FakePlaceholder> placeholder;
  FakeShowing showing = FakeShowing::notBegun;

  [[nodiscard]] static FakeCoordinator of(std::string identifier,
                                          platform::CoordinatorKind kind = platform::CoordinatorKind::initiating);

  [[nodiscard]] FakeCoordinator madeBy(platform::ClientIdentity client) const;
  [[nodiscard]] FakeCoordinator withoutIdentifier() const;
  [[nodiscard]] FakeCoordinator withError(Error value) const;
  [[nodiscard]] FakeCoordinator withOptions(platform::InstallOptions value) const;
  /// Sets an empty list of on-demand resources.
  [[nodiscard]] FakeCoordinator withoutODRAssets() const;
  [[nodiscard]] FakeCoordinator withAppAsset(FakePromise promise) const;
  [[nodiscard]] FakeCoordinator withResponsibleClient(platform::ClientIdentity client) const;
  [[nodiscard]] FakeCoordinator withUserData(FakePromise promise) const;
  [[nodiscard]] FakeCoordinator withPlaceholder(FakePlaceholder value) const;

  /// Returns a deep copy.
  [[nodiscard]] FakeCoordinator snapshot() const;
  /// Returns all promises, including that of the icon.
  [[nodiscard]] std::vector<std::shared_ptr<FakePromise>> promises() const;
};

/// Returns the name of a kind in journal lines and descriptions: "initiating", "updating", "restoring",
/// "restoringDemoted", "any".
[[nodiscard]] std::string_view nameOf(platform::CoordinatorKind kind);

}  // namespace appsync::test
