#include "transfer/SkipRules.h"

#include <algorithm>
#include <array>

namespace appsync {

namespace {

using Candidate = TransferCandidate;

struct SkipRule {
  bool (*applies)(const Candidate& candidate);
  void (*explain)(const Candidate& candidate, const PlugInLog& log);
};

// In the messages on demotion the automatic flag stands first, whatever their words say.
constexpr std::array kSkipRules{
    SkipRule{[](const Candidate& candidate) { return !candidate.isRestore && !candidate.installationIsAllowed; },
             [](const Candidate& candidate, const PlugInLog& log) {
               log.message("%s|skipping %{public}@ - its not a restore and app installation is disabled",
                           candidate.identifier);
             }},
    SkipRule{[](const Candidate& candidate) { return candidate.isRestore && candidate.isToBeIgnored; },
             [](const Candidate& candidate, const PlugInLog& log) {
               log.message("%s|%{public}@ is currenlty marked as to be ignored for download - skipping",
                           candidate.identifier);
             }},
    SkipRule{[](const Candidate& candidate) { return candidate.isRestore && candidate.usesInstallCoordinator; },
             [](const Candidate& candidate, const PlugInLog& log) {
               log.message(
                   "%s|%{public}@ is currenlty marked to be restored and will be handled by bazaarlyd - skipping",
                   candidate.identifier);
             }},
    SkipRule{[](const Candidate& candidate) { return candidate.isSystemApp && candidate.usesInstallCoordinator; },
             [](const Candidate& candidate, const PlugInLog& log) {
               log.message("%s|%{public}@ is auto demoted: %d, manual demoted: %d, system app:%d - skipping",
                           candidate.identifier, candidate.isAutomaticallyDemoted, candidate.isIntentionallyDemoted, 1);
             }},
    SkipRule{[](const Candidate& candidate) { return candidate.isSystemAppPlaceholder; },
             [](const Candidate& candidate, const PlugInLog& log) {
               log.message("%s|%{public}@ is system app placeholder - skipping", candidate.identifier);
             }},
    SkipRule{[](const Candidate& candidate) {
               return candidate.isDemotedUnderCoordination() && !candidate.isRequestedByHost;
             },
             [](const Candidate& candidate, const PlugInLog& log) {
               log.message("%s|%{public}@ is currenlty demoted (manual:%d, auto:%d) - skipping", candidate.identifier,
                           candidate.isAutomaticallyDemoted, candidate.isIntentionallyDemoted);
             }},
};

}  // namespace

bool isSkipped(const TransferCandidate& candidate, const PlugInLog& log) {
  const auto rule =
      std::find_if(kSkipRules.begin(), kSkipRules.end(), [&](const SkipRule& each) { return each.applies(candidate); });
  if (rule != kSkipRules.end()) {
    rule->explain(candidate, log);
    return true;
  }
  if (candidate.isDemotedUnderCoordination()) {
    log.message(
        "%s|%{public}@ is currenlty demoted (manual:%d, auto:%d) - but will be installed as it's requested by client",
        candidate.identifier, candidate.isAutomaticallyDemoted, candidate.isIntentionallyDemoted);
  }
  return false;
}

}  // namespace appsync
