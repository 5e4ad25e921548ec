// Readable names of install types, states and phases.
#include <cstddef>
#include <cstdint>
#include <limits>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "base/Describe.h"
#include "common/InstallNames.h"

namespace appsync::test {

namespace {

using platform::TSInstallPhase;
using platform::TSInstallState;
using platform::TSInstallType;

constexpr std::uint64_t kLargest = std::numeric_limits<std::uint64_t>::max();

}  // namespace

TEST(InstallTypeName, EveryKnownTypeHasItsName) {
  const std::vector<std::string> names{
      "TSInstallTypeNone", "TSInstallTypeStoreDownload",   "TSInstallTypeRestore",   "TSInstallTypeAutomaticDownload",
      "TSInstallTypeSync", "TSInstallTypeAutomaticUpdate", "TSInstallTypeMigration", "TSInstallTypeDowngrade"};
  for (std::size_t value = 0; value < names.size(); ++value)
    EXPECT_EQ(description(TSInstallType{value}), names[value]);
}

TEST(InstallTypeName, AnUnknownTypeIsNamedByItsNumber) {
  EXPECT_EQ(description(TSInstallType{8}), "Unknown Install Type: 8");
  EXPECT_EQ(description(TSInstallType{kLargest}), "Unknown Install Type: 18446744073709551615");
}

TEST(InstallStateName, EveryKnownStateHasItsName) {
  const std::vector<std::string> names{"TSInstallStateWaiting",  "TSInstallStateActive", "TSInstallStatePaused",
                                       "TSInstallStateCanceled", "TSInstallStateFailed", "TSInstallStateFinished"};
  for (std::size_t value = 0; value < names.size(); ++value)
    EXPECT_EQ(description(TSInstallState{value}), names[value]);
}

TEST(InstallStateName, AnUnknownStateIsNamedByItsNumber) {
  EXPECT_EQ(description(TSInstallState{6}), "Unknown Install State: 6");
  EXPECT_EQ(description(TSInstallState{kLargest}), "Unknown Install State: 18446744073709551615");
}

TEST(InstallPhaseName, EveryKnownPhaseHasItsName) {
  const std::vector<std::string> names{"TSInstallPhaseLoading", "TSInstallPhaseInstalling",
                                       "TSInstallPhaseRestoringData", "TSInstallPhaseInstallingPlaceholder"};
  for (std::size_t value = 0; value < names.size(); ++value)
    EXPECT_EQ(description(TSInstallPhase{value}), names[value]);
}

TEST(InstallPhaseName, AnUnknownPhaseIsNamedByItsNumber) {
  EXPECT_EQ(description(TSInstallPhase{4}), "Unknown Install Phase: 4");
  EXPECT_EQ(description(TSInstallPhase{kLargest}), "Unknown Install Phase: 18446744073709551615");
}

}  // namespace appsync::test
