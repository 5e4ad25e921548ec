// What a running install counts as.
#pragma once

#include "platform/InstallTypes.h"

namespace appsync {

enum class InstallActivity { inProgress, restoring, neither };

/// The first line that matches decides. Only a store download counts while it still loads its package; syncs and
/// updates count once they are installing.
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

}  // namespace appsync
