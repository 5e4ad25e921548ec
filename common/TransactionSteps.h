// The two entries of a step in the transaction log.
#pragma once

#include <string_view>

#include "platform/TransactionLog.h"

namespace appsync {

inline void beginStep(platform::TransactionLog& log, platform::TransactionStep step, std::string_view bundleIdentifier,
                      std::string_view description) {
  log.logStep(step, platform::TransactionParty::syncClient, platform::TransactionPhase::begin, true, bundleIdentifier,
              description);
}

inline void endStep(platform::TransactionLog& log, platform::TransactionStep step, bool success,
                    std::string_view bundleIdentifier, std::string_view description) {
  log.logStep(step, platform::TransactionParty::syncClient, platform::TransactionPhase::end, success, bundleIdentifier,
              description);
}

}  // namespace appsync
