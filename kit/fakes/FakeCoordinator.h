// Coordinators, placeholders and promises as tests describe them, and as the fake service reports them.
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

/// Who took something back, and why.
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
  /// Whether a coordinator or placeholder has or had it.
  bool isAttached = false;
  /// The app is being installed with it.
  bool isTaken = false;
  /// What it belonged to has ended.
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
  /// The outer one tells whether it was set at all.
  std::optional<std::optional<platform::StoreMetadata>> metadata;
  std::optional<Bytes> sinfData;
  bool isConfigured = false;
  /// Whether a coordinator has or had it.
  bool isAttached = false;
  /// Whether the home screen shows it.
  bool isShown = false;
  std::optional<FakeCancellation> cancellation;
};

enum class FakeCoordinatorStage : std::uint8_t { waiting, installing, ended };

/// How far the service is with putting a placeholder on the home screen.
enum class FakeShowing : std::uint8_t { notBegun, underWay, over };

/// One coordinator. Made by what it is, then adapted:
/// `FakeCoordinator::of("com.a", CoordinatorKind::updating).madeBy(ClientIdentity::CXClientBazaarly)`.
struct FakeCoordinator {
  std::string identifier;
  platform::CoordinatorKind kind = platform::CoordinatorKind::initiating;
  platform::ClientIdentity creator = platform::ClientIdentity::CXClientSync;
  /// Whether clients are told no identifier.
  bool hasLostIdentifier = false;
  FakeCoordinatorStage stage = FakeCoordinatorStage::waiting;
  std::optional<Error> error;
  std::optional<FakeCancellation> cancellation;
  std::weak_ptr<platform::InstallObserverDelegate> observer;
  std::optional<platform::InstallOptions> options;
  /// None while there are no such promises; empty when it was said that there is nothing to wait for.
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
  /// With the message that there are none.
  [[nodiscard]] FakeCoordinator withoutODRAssets() const;
  [[nodiscard]] FakeCoordinator withAppAsset(FakePromise promise) const;
  [[nodiscard]] FakeCoordinator withResponsibleClient(platform::ClientIdentity client) const;
  [[nodiscard]] FakeCoordinator withUserData(FakePromise promise) const;
  [[nodiscard]] FakeCoordinator withPlaceholder(FakePlaceholder value) const;

  /// A copy that shares nothing that changes.
  [[nodiscard]] FakeCoordinator snapshot() const;
  /// Everything that it promises, its icon included.
  [[nodiscard]] std::vector<std::shared_ptr<FakePromise>> promises() const;
};

/// The word for a kind in journal lines and descriptions: "initiating", "updating", "restoring", "restoringDemoted",
/// "any".
[[nodiscard]] std::string_view nameOf(platform::CoordinatorKind kind);

}  // namespace appsync::test
