#include "common/InstallNames.h"

#include <array>
#include <cstddef>
#include <cstdint>
#include <string_view>

#include "base/Message.h"

namespace appsync {

namespace {

constexpr std::array<std::string_view, 8> kTypeNames{
    "TSInstallTypeNone", "TSInstallTypeStoreDownload",   "TSInstallTypeRestore",   "TSInstallTypeAutomaticDownload",
    "TSInstallTypeSync", "TSInstallTypeAutomaticUpdate", "TSInstallTypeMigration", "TSInstallTypeDowngrade"};

constexpr std::array<std::string_view, 6> kStateNames{"TSInstallStateWaiting", "TSInstallStateActive",
                                                      "TSInstallStatePaused",  "TSInstallStateCanceled",
                                                      "TSInstallStateFailed",  "TSInstallStateFinished"};

constexpr std::array<std::string_view, 4> kPhaseNames{"TSInstallPhaseLoading", "TSInstallPhaseInstalling",
                                                      "TSInstallPhaseRestoringData",
                                                      "TSInstallPhaseInstallingPlaceholder"};

/// Returns the number's name in the table, or `fallback` filled with the number.
template <std::size_t kCount, class Enumeration>
std::string nameIn(const std::array<std::string_view, kCount>& names, Enumeration value,
                   MessageFormat<std::uint64_t> fallback) {
  const auto number = static_cast<std::uint64_t>(value);
  return number < kCount ? std::string(names[number]) : formatMessage<std::uint64_t>(fallback, number);
}

}  // namespace

std::string installTypeName(platform::TSInstallType type) {
  return nameIn(kTypeNames, type, "Unknown Install Type: %lu");
}

std::string installStateName(platform::TSInstallState state) {
  return nameIn(kStateNames, state, "Unknown Install State: %lu");
}

std::string installPhaseName(platform::TSInstallPhase phase) {
  return nameIn(kPhaseNames, phase, "Unknown Install Phase: %lu");
}

}  // namespace appsync
