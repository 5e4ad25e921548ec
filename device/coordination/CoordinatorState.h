// What is known of coordinators, placeholders and promises. All of it is guarded by the lock of `Coordinators`.
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "base/Bytes.h"
#include "base/Error.h"
#include "device/coordination/CoordinatorObservers.h"
#include "platform/InstallCoordinator.h"

namespace appsync::device {

/// What a promise was given to its coordinator as. The numbers are stored.
enum class PromiseRole : std::uint8_t { appAsset = 0, userData = 1, icon = 2, initialODRAsset = 3 };

struct CoordinatorState;

struct PromiseState {
  std::string name;
  platform::ClientIdentity client = platform::ClientIdentity::CXClientSync;
  std::uint64_t diskSpaceNeeded = 0;
  std::optional<platform::FileLocation> transferPath;
  double fraction = 0;
  bool isComplete = false;
  bool isCancelled = false;
  /// What it belonged to has ended.
  bool isOver = false;
  /// Its path or fraction are still to be stored.
  bool hasUnsavedChanges = false;
  /// None while it is attached to nothing.
  std::optional<PromiseRole> role;
  /// Null until it, or the placeholder that has it, is a coordinator's.
  std::weak_ptr<CoordinatorState> coordinator;

  [[nodiscard]] bool isFulfilled() const { return isComplete && !isCancelled; }
  [[nodiscard]] bool canChange() const { return !isCancelled && !isOver; }
};

/// What of a placeholder can be configured.
struct PlaceholderConfiguration {
  std::shared_ptr<PromiseState> icon;
  platform::PlaceholderAttributes attributes;
  /// The attributes' info dictionary and the store metadata as binary property lists.
  Bytes infoDocument;
  std::optional<Bytes> storeMetadata;
  std::optional<Bytes> licence;
  bool isConfigured = false;
};

struct PlaceholderState : PlaceholderConfiguration {
  std::string bundleName;
  std::string identifier;
  platform::TSInstallType installType = platform::TSInstallType::None;
  platform::ClientIdentity client = platform::ClientIdentity::CXClientSync;
  bool isCancelled = false;
  /// Whether a coordinator has or had it; null once that has gone.
  bool isAttached = false;
  std::weak_ptr<CoordinatorState> coordinator;
};

/// Install options, as far as the service needs them.
struct CoordinatorOptions {
  platform::TSInstallType installType = platform::TSInstallType::None;
  std::uint64_t installTargetType = 0;
  std::optional<Bytes> storeMetadata;
};

/// What of a coordinator is set without the promises that the service waits for.
struct CoordinatorChoices {
  std::optional<platform::ClientIdentity> responsibleClient;
  std::optional<CoordinatorOptions> options;
  bool hasInitialODRAssets = false;
  /// Those given in this process: which they were is not stored.
  std::vector<std::shared_ptr<PromiseState>> initialODRAssets;
};

enum class CoordinatorStage : std::uint8_t { waiting, installing, ended };

/// The first four never change.
struct CoordinatorState : CoordinatorChoices {
  std::int64_t number = 0;  ///< grows from one that is made to the next
  std::string identifier;
  platform::CoordinatorKind kind = platform::CoordinatorKind::initiating;
  platform::ClientIdentity creator = platform::ClientIdentity::CXClientSync;
  std::shared_ptr<PromiseState> appAsset;
  std::shared_ptr<PromiseState> userData;
  std::shared_ptr<PlaceholderState> placeholder;
  CoordinatorStage stage = CoordinatorStage::waiting;
  std::optional<Error> error;

  CoordinatorObservers::Observer observer;

  [[nodiscard]] bool showsPlaceholder() const { return placeholder && placeholder->isConfigured; }
  /// The package's path, once the package is the service's.
  [[nodiscard]] std::optional<std::string> ownPackage() const {
    if (!appAsset || !appAsset->isFulfilled() || !appAsset->transferPath) return std::nullopt;
    return appAsset->transferPath->path;
  }
  /// Whether the app can be installed now. A restored app's options are its placeholder's.
  [[nodiscard]] bool isReady() const {
    const bool restores =
        kind == platform::CoordinatorKind::restoring || kind == platform::CoordinatorKind::restoringDemoted;
    return stage == CoordinatorStage::waiting && (options || restores) && placeholder && appAsset &&
           appAsset->isFulfilled() && (!userData || userData->isFulfilled());
  }
};

}  // namespace appsync::device
