// The installs that are running on the device.
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

/// Queries the registry, not the plug-in's files, so that the result includes installs started by other clients. One
/// object serves one query.
class InProgressAssetQuery final : public platform::AppRegistryObserver {
 public:
  using IdentifierList = std::vector<std::string>;

  /// currentInProgressAssetIDs:restoringAssetIDs: (class operation) blocks until the registry has reported. Resets
  /// both lists to nullopt if it did not.
  static void currentInProgressAssetIDs(platform::Platform& platform, std::optional<IdentifierList>& inProgressAssetIDs,
                                        std::optional<IdentifierList>& restoringAssetIDs);

  explicit InProgressAssetQuery(platform::Platform& platform);

  /// Waits for the first observation. Returns false if the wait ended without one.
  [[nodiscard]] bool _fetchResults();

  /// _inProgressAssetIDs, _restoringAssetIDs: null until the first observation; then constant, and valid longer than
  /// the query.
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
