// What a running install counts as.
#include <cstdint>

#include <gtest/gtest.h>

#include "coordination/InProgressAssetQuery.h"

namespace appsync::test {

namespace {

using platform::TSInstallPhase;
using platform::TSInstallState;
using platform::TSInstallType;

constexpr std::uint64_t kTypes = 10;
constexpr std::uint64_t kStates = 7;
constexpr std::uint64_t kPhases = 5;

constexpr InstallActivity activeWith(TSInstallType type, TSInstallPhase phase) {
  return installActivity(type, TSInstallState::Active, phase);
}

}  // namespace

TEST(InstallActivity, AStoreDownloadThatLoadsIsInProgress) {
  EXPECT_EQ(activeWith(TSInstallType::StoreDownload, TSInstallPhase::Loading), InstallActivity::inProgress);
}

TEST(InstallActivity, NothingElseThatLoadsIsInProgress) {
  for (std::uint64_t type = 0; type < kTypes; ++type) {
    const TSInstallType installType{type};
    if (installType == TSInstallType::StoreDownload) continue;
    EXPECT_NE(activeWith(installType, TSInstallPhase::Loading), InstallActivity::inProgress) << type;
  }
  EXPECT_EQ(activeWith(TSInstallType::Sync, TSInstallPhase::Loading), InstallActivity::neither);
}

TEST(InstallActivity, EverythingButARestoreIsInProgressWhileItInstalls) {
  for (std::uint64_t type = 0; type < kTypes; ++type) {
    const TSInstallType installType{type};
    if (installType == TSInstallType::Restore) continue;
    EXPECT_EQ(activeWith(installType, TSInstallPhase::Installing), InstallActivity::inProgress) << type;
  }
}

TEST(InstallActivity, ARestoreThatLoadsOrInstallsIsRestoring) {
  EXPECT_EQ(activeWith(TSInstallType::Restore, TSInstallPhase::Loading), InstallActivity::restoring);
  EXPECT_EQ(activeWith(TSInstallType::Restore, TSInstallPhase::Installing), InstallActivity::restoring);
}

TEST(InstallActivity, LaterPhasesAreNeither) {
  for (std::uint64_t type = 0; type < kTypes; ++type) {
    for (std::uint64_t phase = 2; phase < kPhases; ++phase)
      EXPECT_EQ(activeWith(TSInstallType{type}, TSInstallPhase{phase}), InstallActivity::neither) << type << phase;
  }
}

TEST(InstallActivity, WhatIsNotActiveIsNeither) {
  for (std::uint64_t state = 0; state < kStates; ++state) {
    if (TSInstallState{state} == TSInstallState::Active) continue;
    for (std::uint64_t type = 0; type < kTypes; ++type) {
      for (std::uint64_t phase = 0; phase < kPhases; ++phase)
        EXPECT_EQ(installActivity(TSInstallType{type}, TSInstallState{state}, TSInstallPhase{phase}),
                  InstallActivity::neither);
    }
  }
}

}  // namespace appsync::test
