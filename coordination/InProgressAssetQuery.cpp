#include "coordination/InProgressAssetQuery.h"

#include "common/InstallNames.h"

namespace appsync {

namespace {

/// Registers an observer for as long as it lives, whichever way it ends.
class Observation {
 public:
  Observation(platform::AppRegistry& registry, platform::AppRegistryObserver& observer)
      : registry_(registry), observer_(observer) {
    registry_.addObserver(observer_);
  }
  ~Observation() { registry_.removeObserver(observer_); }
  Observation(const Observation&) = delete;
  Observation& operator=(const Observation&) = delete;

 private:
  platform::AppRegistry& registry_;
  platform::AppRegistryObserver& observer_;
};

}  // namespace

void InProgressAssetQuery::currentInProgressAssetIDs(platform::Platform& platform,
                                                     std::optional<IdentifierList>& inProgressAssetIDs,
                                                     std::optional<IdentifierList>& restoringAssetIDs) {
  inProgressAssetIDs.reset();
  restoringAssetIDs.reset();
  InProgressAssetQuery query(platform);
  const Observation observation(platform.defaultRegistry(), query);
  if (query._fetchResults()) {
    inProgressAssetIDs = *query.inProgressAssetIDs();
    restoringAssetIDs = *query.restoringAssetIDs();
  }
}

InProgressAssetQuery::InProgressAssetQuery(platform::Platform& platform)
    : _log(platform.syncFramework()), _waitForInitialObservationData(platform.clock(), 0) {}

bool InProgressAssetQuery::_fetchResults() {
  _log.message("%s|Waiting for -applicationInstallsArePrioritized:arePaused: to complete...");
  if (!_waitForInitialObservationData.wait(kForever)) {
    _log.error("%s|Query for in progress assets timed out");
    return false;
  }
  _log.message("%s|Wait completed");
  return true;
}

void InProgressAssetQuery::applicationInstallsArePrioritized(const platform::AppRecords& prioritized,
                                                             const platform::AppRecords& paused) {
  _log.summary("%s|prioritized proxies %{public}@ paused proxies %{public}@", prioritized, paused);
  if (_inProgressAssetIDs) return;

  auto inProgress = std::make_shared<IdentifierList>();
  auto restoring = std::make_shared<IdentifierList>();
  if (prioritized.empty()) _log.message("%s|No assets currently in progress.");
  for (const auto& record : prioritized)
    classify(*record, *inProgress, *restoring);
  _inProgressAssetIDs = std::move(inProgress);
  _restoringAssetIDs = std::move(restoring);

  _log.message("%s|signaling semaphore");
  _waitForInitialObservationData.signal();
}

void InProgressAssetQuery::classify(const platform::AppRecord& record, IdentifierList& inProgress,
                                    IdentifierList& restoring) const {
  const std::string identifier = record.applicationIdentifier();
  if (!record.isPlaceholder()) {
    _log.message("%s|No placeholder for asset identifier %{public}@", identifier);
    return;
  }
  const auto progress = record.installProgress();
  if (!progress) {
    _log.message("%s|No install progress found for asset identifier %{public}@", identifier);
    return;
  }
  const auto type = record.installType();
  const auto state = progress->installState();
  const auto phase = progress->installPhase();
  _log.message("%s|Got install type=%{public}@ state=%{public}@ phase=%{public}@ for %{public}@", type, state, phase,
               identifier);
  switch (installActivity(type, state, phase)) {
    case InstallActivity::inProgress:
      inProgress.push_back(identifier);
      break;
    case InstallActivity::restoring:
      restoring.push_back(identifier);
      break;
    case InstallActivity::neither:
      break;
  }
}

}  // namespace appsync
