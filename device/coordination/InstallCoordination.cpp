#include "device/coordination/InstallCoordination.h"

#include <algorithm>
#include <utility>

#include "device/coordination/CoordinatorHandle.h"
#include "device/coordination/PlaceholderHandle.h"
#include "device/coordination/PromiseHandles.h"
#include "device/packages/BundleIdentifier.h"

namespace appsync::device {

using platform::ClientIdentity;
using platform::CoordinatorKind;

namespace {

Error noBundleIdentifier(std::string_view text) {
  constexpr std::size_t kShown = 80;
  return coordinationError(CoordinationFailure::badIdentifier,
                           "\"" + std::string(text.substr(0, kShown)) + (text.size() > kShown ? "…" : "") +
                               "\" is not a bundle identifier: it may have only letters, digits, '-', '.' and '_', at "
                               "most 200 and no dot first");
}

std::shared_ptr<PromiseState> newPromise(std::string_view name, ClientIdentity client, std::uint64_t diskSpaceNeeded) {
  auto state = std::make_shared<PromiseState>();
  state->name = name;
  state->client = client;
  state->diskSpaceNeeded = diskSpaceNeeded;
  return state;
}

CoordinatorPhase phaseOf(const CoordinatorState& state) {
  if (state.stage == CoordinatorStage::installing || state.isReady()) return CoordinatorPhase::installing;
  if (state.appAsset == nullptr) return CoordinatorPhase::preparing;
  return state.appAsset->isFulfilled() ? CoordinatorPhase::waiting : CoordinatorPhase::loading;
}

CoordinatorSummary summaryOf(const CoordinatorState& state) {
  const bool hasName = state.placeholder && !state.placeholder->bundleName.empty();
  return {.identifier = state.identifier,
          .name = hasName ? state.placeholder->bundleName : state.identifier,
          .kind = state.kind,
          .creator = state.creator,
          .phase = phaseOf(state),
          .fraction = state.appAsset ? state.appAsset->fraction : 0};
}

}  // namespace

InstallCoordination::InstallCoordination(Database& database, DeviceFileSystem& files, AppRegistry& registry,
                                         Settings& settings, Access access)
    : database_(database),
      access_(access),
      isEnabled_(settings.coordinationIsOn()),
      coordinators_(std::make_shared<Coordinators>(database, files, registry)) {
  if (isEnabled_ && access == Access::exclusive) coordinators_->begin();
}

InstallCoordination::~InstallCoordination() {
  coordinators_->end();
}

std::shared_ptr<platform::InstallCoordinator> InstallCoordination::coordinatorForApp(CoordinatorKind kind,
                                                                                     std::string_view bundleIdentifier,
                                                                                     ClientIdentity client,
                                                                                     platform::IfMissing ifMissing,
                                                                                     bool* created, ErrorSlot error) {
  const auto refuse = [error](Error reason) {
    setError(error, std::move(reason));
    return nullptr;
  };
  if (!isEnabled_) return refuse(coordinationError(CoordinationFailure::off, "install coordination is off"));
  if (!isBundleIdentifier(bundleIdentifier)) return refuse(noBundleIdentifier(bundleIdentifier));
  std::shared_ptr<CoordinatorState> found;
  bool isNew = false;
  if (ifMissing == platform::IfMissing::findNothing || kind == CoordinatorKind::any) {
    found = coordinators_->find(kind, bundleIdentifier, client);
    if (!found) return nullptr;
  } else {
    Result<std::shared_ptr<CoordinatorState>> made = coordinators_->findOrMake(kind, bundleIdentifier, client, isNew);
    if (!made) return refuse(made.error());
    found = std::move(made).value();
  }
  if (created != nullptr) *created = isNew;
  return std::make_shared<CoordinatorHandle>(coordinators_, std::move(found), client);
}

std::shared_ptr<platform::Placeholder> InstallCoordination::initAppPlaceholder(std::string_view bundleName,
                                                                               std::string_view bundleIdentifier,
                                                                               platform::TSInstallType installType,
                                                                               ClientIdentity client) {
  if (!isEnabled_ || !isBundleIdentifier(bundleIdentifier)) return nullptr;
  const auto state = std::make_shared<PlaceholderState>();
  state->bundleName = bundleName;
  state->identifier = bundleIdentifier;
  state->installType = installType;
  state->client = client;
  return std::make_shared<PlaceholderHandle>(coordinators_, state);
}

std::shared_ptr<platform::PromisedTransferToPath> InstallCoordination::makePromisedTransferToPath(
    std::string_view name, ClientIdentity client, const std::optional<platform::FileLocation>& transferPath,
    std::uint64_t diskSpaceNeeded) {
  if (!isEnabled_) return nullptr;
  const auto state = newPromise(name, client, diskSpaceNeeded);
  state->transferPath = transferPath;
  return std::make_shared<TransferToPathPromise>(coordinators_, state);
}

std::shared_ptr<platform::PromisedOutOfBandTransfer> InstallCoordination::makePromisedOutOfBandTransfer(
    std::string_view name, ClientIdentity client, std::uint64_t diskSpaceNeeded) {
  if (!isEnabled_) return nullptr;
  return std::make_shared<OutOfBandPromise>(coordinators_, newPromise(name, client, diskSpaceNeeded));
}

void InstallCoordination::uninstallApp(std::string_view bundleIdentifier, platform::UserConfirmation,
                                       UninstallCompletion completion) {
  coordinators_->uninstall(std::string(bundleIdentifier), std::move(completion));
}

Error InstallCoordination::createUserPresentableError(long code, const plist::Dictionary&, const Error& underlying) {
  return {std::string(platform::kInstallCoordinationErrorDomain), code, underlying.text,
          std::make_shared<const Error>(underlying)};
}

std::unique_ptr<platform::InstallObserver> InstallCoordination::initWithMachServiceName(
    std::string_view, const std::set<ClientIdentity>& clients, platform::InstallObserverDelegate& delegate) {
  return coordinators_->observers().connect(clients, delegate);
}

bool InstallCoordination::prioritize(std::string_view bundleIdentifier) {
  return coordinators_->prioritize(bundleIdentifier);
}

Status InstallCoordination::cancelByUser(std::string_view bundleIdentifier) {
  return coordinators_->cancelAll(bundleIdentifier,
                                  coordinationError(CoordinationFailure::cancelledByUser, "cancelled on the device"),
                                  ClientIdentity::CXClientUser);
}

Result<std::vector<CoordinatorSummary>> InstallCoordination::list() {
  std::vector<CoordinatorSummary> summaries;
  if (access_ == Access::exclusive) {
    for (const auto& state : coordinators_->all())
      summaries.push_back(coordinators_->read([&] { return summaryOf(*state); }));
    return summaries;
  }
  Database::Session session(database_);
  const auto stored = coordinator_table::all(session);
  if (!stored) return stored.error();
  std::ranges::transform(*stored, std::back_inserter(summaries), [](const auto& state) { return summaryOf(*state); });
  return summaries;
}

bool InstallCoordination::waitUntilIdle(std::chrono::milliseconds timeout) {
  return coordinators_->waitUntilIdle(std::chrono::steady_clock::now() + timeout);
}

}  // namespace appsync::device
