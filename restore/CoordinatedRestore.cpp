// Getting a restored app ready with the install-coordination service.
#include "common/PropertyListFile.h"
#include "common/SyncError.h"
#include "common/TransactionSteps.h"
#include "coordination/Preparation.h"
#include "core/AppsClient.h"
#include "restore/RestoreMetadata.h"

namespace appsync {

namespace {

using platform::ClientIdentity;
using platform::CoordinatorKind;
using platform::TransactionStep;

/// Whether an app's package is asked for: a demoted app stays without one.
enum class Package { fromStore, none };

/// The differences between restoring a demoted app and any other app.
struct RestoreFlow {
  CoordinatorKind kind;
  Package package;
  std::string_view step;
  PlugInLog::Format<std::string> begins;
  PlugInLog::Format<std::string, bool, std::optional<Error>> ends;
};

constexpr RestoreFlow kNotDemoted{
    CoordinatorKind::restoring, Package::fromStore, "Restore app",
    "%s|processing app restore for non demoted bundle '%{public}@' with install coordination",
    "%s|processing app restore for %{public}@ finished with status %d error %{public}@"};
constexpr RestoreFlow kDemoted{
    CoordinatorKind::restoringDemoted, Package::none, "Restore demoted app",
    "%s|processing app restore for demoted bundle '%{public}@' with install coordination",
    "%s|processing app restore for demoted app %{public}@ finished with status %d error %{public}@"};

/// The app's data from the backup, and the parsed metadata.
struct RestorePreparation : CoordinatedPreparation {
  const RestoreFlow& flow;
  DemotionStatus status;
  ByteView metadataBytes;
  const std::optional<ByteView>& sinf;
  const std::optional<ByteView>& icon;
  plist::Dictionary metadata = {};
};

bool readMetadata(RestorePreparation& preparation) {
  auto metadata = dictionaryOf(plist::read(preparation.metadataBytes));
  if (!metadata) {
    preparation.error = metadata.error();
    preparation.log.error(kRestoreMetadataUnreadable, std::string_view(preparation.identifier), metadata.error());
    return false;
  }
  preparation.metadata = std::move(metadata).value();
  return true;
}

bool failWithoutCoordinator(RestorePreparation& preparation) {
  preparation.log.error("%s|Error %{public}@ creating restore coordinator for %{public}@", preparation.error,
                        preparation.identifier);
  return false;
}

bool takeCoordinator(RestorePreparation& preparation) {
  preparation.coordinator = preparation.platform.installCoordination().coordinatorForApp(
      preparation.flow.kind, preparation.identifier, ClientIdentity::CXClientSync, platform::IfMissing::create, nullptr,
      &preparation.error);
  return preparation.coordinator != nullptr || failWithoutCoordinator(preparation);
}

/// Returns true if the store is already responsible for the package; nothing is left to do.
bool storeIsResponsible(const RestorePreparation& preparation) {
  if (preparation.flow.package == Package::none) return false;
  const ClientIdentity responsible = preparation.coordinator->appAssetPromiseResponsibleClient(nullptr);
  if (responsible != ClientIdentity::CXClientBazaarly) return false;
  preparation.log.message("%s|App asset DRI for %{public}@ is set to %lu - nothing more for zeph to do",
                          preparation.identifier, static_cast<std::uint64_t>(responsible));
  return true;
}

/// Coordinators created by other clients must not be changed; treats one as missing.
bool observeCoordinator(RestorePreparation& preparation) {
  const ClientIdentity creator = preparation.coordinator->creatorIdentifier();
  if (creator != ClientIdentity::CXClientSync) {
    preparation.coordinator.reset();
    preparation.error = syncError(SyncFailure::restoreGivenUp);
    preparation.error->text =
        "client " + std::to_string(static_cast<std::uint64_t>(creator)) + " created the coordinator";
    return failWithoutCoordinator(preparation);
  }
  preparation.coordinator->setObserver(preparation.client.weak_from_this());
  return true;
}

/// Tells the coordinator that there is no data to wait for. Without a promise it does not wait either.
bool provideUserData(RestorePreparation& preparation) {
  if (preparation.coordinator->hasUserDataPromise()) {
    preparation.log.message("%s|Coordinator for %{public}@ has a valid user data promise", preparation.identifier);
    return true;
  }
  const auto promise = preparation.client._userDataPromiseForBundleIdentifier(preparation.identifier);
  if (!promise) return true;
  const bool isAttached = preparation.report(preparation.coordinator->setUserDataPromise(promise),
                                             "%s|Added out of band user data promise for for %{public}@",
                                             "%s|Error %{public}@ adding out of band data promise for '%{public}@'");
  if (!isAttached) {
    promise->cancelForReason(syncError(SyncFailure::restoreGivenUp), ClientIdentity::CXClientSync).ignore();
  }
  return isAttached;
}

bool providePlaceholder(RestorePreparation& preparation) {
  if (preparation.coordinator->hasPlaceholderPromise()) {
    preparation.log.message("%s|Coordinator for %{public}@ has a valid placeholder promise", preparation.identifier);
    return true;
  }
  preparation.placeholder = preparation.client._placeHolderForBundleIdentifierWithHarvoMetadata(
      preparation.identifier, preparation.metadata, preparation.sinf, preparation.icon, preparation.status);
  if (!preparation.placeholder) return false;
  // In one step: the service may report the placeholder before this call returns.
  const Status set = preparation.client._awaitPlaceholderAfter(
      [&] { return preparation.coordinator->setPlaceholderPromise(preparation.placeholder); }, preparation.identifier);
  if (!preparation.report(set, "%s|added placeholder promise for %{public}@",
                          "%s|Error %{public}@ setting placeholder promise for '%{public}@'")) {
    return false;
  }
  preparation.placeholder.reset();
  return true;
}

bool handPackageToStore(RestorePreparation& preparation) {
  return preparation.flow.package == Package::none ||
         preparation.report(
             preparation.coordinator->setAppAssetPromiseResponsibleClient(ClientIdentity::CXClientBazaarly),
             "%s|set CXClientBazaarly to satisfy app asset promise for %{public}@",
             "%s|Error %{public}@ setting CXClientBazaarly to satisfy app data promise for '%{public}@'");
}

/// What the preparation holds must not stay behind, and nobody may wait for it.
void giveUp(const RestorePreparation& preparation) {
  const Error reason = syncError(SyncFailure::restoreGivenUp);
  preparation.cancelCoordinator(reason);
  preparation.cancelPlaceholder(reason);
  preparation.client.dataMigratorCancelledCoordinatorForRestoreAppBundle(preparation.identifier);
}

bool prepare(RestorePreparation preparation) {
  const RestoreFlow& flow = preparation.flow;
  platform::TransactionLog& transactions = preparation.platform.transactionLog();
  preparation.log.message(flow.begins, preparation.identifier);
  beginStep(transactions, TransactionStep::restoreApp, preparation.identifier, flow.step);

  const bool hasCoordinator = readMetadata(preparation) && takeCoordinator(preparation);
  if (hasCoordinator && storeIsResponsible(preparation)) {
    endStep(transactions, TransactionStep::restoreApp, true, preparation.identifier, flow.step);
    return true;
  }
  const bool isReady = hasCoordinator && observeCoordinator(preparation) && provideUserData(preparation) &&
                       providePlaceholder(preparation) && handPackageToStore(preparation);

  preparation.log.message(flow.ends, preparation.identifier, isReady, preparation.error);
  endStep(transactions, TransactionStep::restoreApp, isReady, preparation.identifier, flow.step);
  if (!isReady) giveUp(preparation);
  return isReady;
}

}  // namespace

bool AppsClient::prepareAppForRestoreUsingCoordination(std::string_view bundleIdentifier, ByteView harvoMetadata,
                                                       const std::optional<ByteView>& sinfData,
                                                       const std::optional<ByteView>& iconData,
                                                       DemotionStatus demotionStatus) {
  return demotionStatus == DemotionStatus::notDemoted
             ? _prepareNonDemotedAppForRestoreWithBundleId(bundleIdentifier, harvoMetadata, sinfData, iconData)
             : _prepareDemotedAppForRestoreWithBundleId(bundleIdentifier, harvoMetadata, sinfData, iconData,
                                                        demotionStatus);
}

bool AppsClient::_prepareNonDemotedAppForRestoreWithBundleId(std::string_view bundleIdentifier, ByteView harvoMetadata,
                                                             const std::optional<ByteView>& sinfData,
                                                             const std::optional<ByteView>& iconData) {
  return prepare({{*this, _platform, _log, std::string(bundleIdentifier)},
                  kNotDemoted,
                  DemotionStatus::notDemoted,
                  harvoMetadata,
                  sinfData,
                  iconData});
}

bool AppsClient::_prepareDemotedAppForRestoreWithBundleId(std::string_view bundleIdentifier, ByteView harvoMetadata,
                                                          const std::optional<ByteView>& sinfData,
                                                          const std::optional<ByteView>& iconData,
                                                          DemotionStatus demotionStatus) {
  return prepare({{*this, _platform, _log, std::string(bundleIdentifier)},
                  kDemoted,
                  demotionStatus,
                  harvoMetadata,
                  sinfData,
                  iconData});
}

}  // namespace appsync
