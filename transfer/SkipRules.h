// The rules by which the host need not send a wanted app.
#pragma once

#include <string>

#include "common/PlugInLog.h"
#include "transfer/WantedEntry.h"

namespace appsync {

/// The input of the rules for one app.
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

/// Whether a rule applies to the app, so that the host need not send it. Logs the first rule that applies.
[[nodiscard]] bool isSkipped(const TransferCandidate& candidate, const PlugInLog& log);

}  // namespace appsync
