// Which wanted apps the host need not send after all, and why.
#pragma once

#include <string>

#include "common/PlugInLog.h"
#include "transfer/WantedEntry.h"

namespace appsync {

/// Everything that the decision on one app rests on.
struct TransferCandidate {
  std::string identifier;
  bool isRestore = false;
  bool isAutomaticallyDemoted = false;
  bool isIntentionallyDemoted = false;
  bool isSystemApp = false;
  bool installationIsAllowed = true;
  bool usesInstallCoordinator = false;
  bool isToBeIgnored = false;  ///< the sync must leave it alone
  bool isSystemAppPlaceholder = false;
  bool isRequestedByHost = false;

  [[nodiscard]] bool isDemotedUnderCoordination() const {
    return (isAutomaticallyDemoted || isIntentionallyDemoted) && usesInstallCoordinator;
  }
};

/// Whether a rule says that the host need not send the app; the log says which. The first rule that applies decides.
[[nodiscard]] bool isSkipped(const TransferCandidate& candidate, const PlugInLog& log);

}  // namespace appsync
