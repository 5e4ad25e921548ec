// The states of coordinators, placeholders and promises. The lock of `Coordinators` guards every field.
//
// A coordinator and the operations of `Coordinators` that change its stage:
//
//     findOrMake: inserts the rows             begin: loads the rows
//              |                                       |
//              +-------------------+-------------------+
//                                  v
//                               waiting <-----------------------------------+
//                                |   |                                      |
//     cancel, cancelAll,         |   | advance: `isReady()`                 | install: the service ends
//     uninstall, endIfDemoted:   |   v                                      | before the install begins
//     delete the rows            |  installing -----------------------------+
//                                |   |
//                                |   | install: the transaction that records the app deletes the rows; after a
//                                |   | failed install a transaction removes the rows and the placeholder
//                                v   v
//                                ended  (the clients' handles keep the state; promises and placeholder end too)
//
// Only coordinators that wait are stored: with their choices, promises and placeholder, in the tables of
// CoordinatorTable.h. Each change is stored before it returns, except the progress of the app asset and the path of an
// incomplete one: `end` and the promise's completion store these. A process that crashes during `install` leaves the
// rows, so that the next `begin` installs the app again.
//
// A promise or placeholder (its completion is a separate flag: a complete promise can still be withdrawn):
//
//     open --withdraw: stores the promise of a coordinator--> withdrawn
//     open --close: the coordinator ends--------------------> ended
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

/// The purpose of a promise for its coordinator. The numbers are stored.
enum class PromiseRole : std::uint8_t { appAsset = 0, userData = 1, icon = 2, initialODRAsset = 3 };

/// `withdrawn` by the client that made it, `ended` with its coordinator. Neither can be changed any more.
enum class PromiseStage : std::uint8_t { open, withdrawn, ended };

struct CoordinatorState;

struct PromiseState {
  std::string name;
  platform::ClientIdentity client = platform::ClientIdentity::CXClientSync;
  std::uint64_t diskSpaceNeeded = 0;
  std::optional<platform::FileLocation> transferPath;
  double fraction = 0;
  bool isComplete = false;
  PromiseStage stage = PromiseStage::open;
  /// The path or fraction has changed since the promise was stored.
  bool hasUnsavedChanges = false;
  /// nullopt until the promise is given to a coordinator or placeholder.
  std::optional<PromiseRole> role;
  /// Null until the promise, or the placeholder that has it, is given to a coordinator.
  std::weak_ptr<CoordinatorState> coordinator;

  [[nodiscard]] bool isOpen() const { return stage == PromiseStage::open; }
  [[nodiscard]] bool isFulfilled() const { return isComplete && stage != PromiseStage::withdrawn; }
};

/// The parts of a placeholder that clients configure.
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
  PromiseStage stage = PromiseStage::open;
  /// Whether the placeholder was given to a coordinator, which may have been destroyed since.
  bool isAttached = false;
  std::weak_ptr<CoordinatorState> coordinator;
};

/// The install options that the service uses.
struct CoordinatorOptions {
  platform::TSInstallType installType = platform::TSInstallType::None;
  std::uint64_t installTargetType = 0;
  std::optional<Bytes> storeMetadata;
};

/// The settings of a coordinator, without its placeholder and the promises that the service waits for.
struct CoordinatorChoices {
  std::optional<platform::ClientIdentity> responsibleClient;
  std::optional<CoordinatorOptions> options;
  bool hasInitialODRAssets = false;
  /// Not stored: empty after a restart.
  std::vector<std::shared_ptr<PromiseState>> initialODRAssets;
};

/// The diagram at the head of this file shows the transitions.
enum class CoordinatorStage : std::uint8_t { waiting, installing, ended };

/// The first four fields never change.
struct CoordinatorState : CoordinatorChoices {
  std::int64_t number = 0;  ///< grows with each new coordinator
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
  /// Returns the path of the package that the service owns, or nullopt until the app asset is complete.
  [[nodiscard]] std::optional<std::string> ownPackage() const {
    if (!appAsset || !appAsset->isFulfilled() || !appAsset->transferPath) return std::nullopt;
    return appAsset->transferPath->path;
  }
  /// Returns whether the app can be installed. A restored app takes its options from its placeholder.
  [[nodiscard]] bool isReady() const {
    const bool restores =
        kind == platform::CoordinatorKind::restoring || kind == platform::CoordinatorKind::restoringDemoted;
    return stage == CoordinatorStage::waiting && (options || restores) && placeholder && appAsset &&
           appAsset->isFulfilled() && (!userData || userData->isFulfilled());
  }
};

}  // namespace appsync::device
