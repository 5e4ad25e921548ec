// Which installs are running on the device at this moment.
#pragma once

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "base/Semaphore.h"
#include "common/PlugInLog.h"
#include "platform/InstallTypes.h"
#include "platform/Platform.h"

namespace appsync {

/// What a running install counts as.
enum class InstallActivity { inProgress, restoring, neither };

/// Classifies a running install; the first rule that matches decides. Only a store download counts while it still
/// loads its package; syncs and updates count once they are installing.
[[nodiscard]] constexpr InstallActivity installActivity(platform::TSInstallType type, platform::TSInstallState state,
                                                        platform::TSInstallPhase phase) {
  using platform::TSInstallPhase;
  using platform::TSInstallState;
  using platform::TSInstallType;
  const bool isActive = state == TSInstallState::Active;
  const bool isRestore = type == TSInstallType::Restore;
  const bool isLoading = phase == TSInstallPhase::Loading;
  const bool isInstalling = phase == TSInstallPhase::Installing;

  if (!isRestore && isActive && isInstalling) return InstallActivity::inProgress;
  if (type == TSInstallType::StoreDownload && isActive && isLoading) return InstallActivity::inProgress;
  if (isRestore && isActive && (isLoading || isInstalling)) return InstallActivity::restoring;
  return InstallActivity::neither;
}

/// Asks the registry, not the plug-in's own files, so that the answer covers installs that other clients started.
/// One query lives for one question.
class InProgressAssetQuery final : public platform::AppRegistryObserver {
 public:
  using IdentifierList = std::vector<std::string>;

  /// currentInProgressAssetIDs:restoringAssetIDs: (class operation) blocks until the registry has reported. Both lists
  /// stay absent when it did not.
  static void currentInProgressAssetIDs(platform::Platform& platform, std::optional<IdentifierList>& inProgressAssetIDs,
                                        std::optional<IdentifierList>& restoringAssetIDs);

  explicit InProgressAssetQuery(platform::Platform& platform);

  /// Waits for the first observation; false if the wait ended without one.
  [[nodiscard]] bool _fetchResults();

  /// _inProgressAssetIDs, _restoringAssetIDs: null until the first observation; then they never change, and stay valid
  /// without the query.
  [[nodiscard]] std::shared_ptr<const IdentifierList> inProgressAssetIDs() const { return _inProgressAssetIDs; }
  [[nodiscard]] std::shared_ptr<const IdentifierList> restoringAssetIDs() const { return _restoringAssetIDs; }

  /// applicationInstallsArePrioritized:arePaused: only the first observation counts.
  void applicationInstallsArePrioritized(const platform::AppRecords& prioritized,
                                         const platform::AppRecords& paused) override;

 private:
  void classify(const platform::AppRecord& record, IdentifierList& inProgress, IdentifierList& restoring) const;

  const PlugInLog _log;
  Semaphore _waitForInitialObservationData;
  // Written by the first observation before it signals, read after the wait.
  std::shared_ptr<const IdentifierList> _inProgressAssetIDs;
  std::shared_ptr<const IdentifierList> _restoringAssetIDs;
};

}  // namespace appsync
