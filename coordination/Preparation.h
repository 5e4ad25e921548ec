// One app's preparation for a coordinated install or restore, as its steps hand it on.
#pragma once

#include <memory>
#include <optional>
#include <string>

#include "base/Error.h"
#include "common/PlugInLog.h"
#include "platform/Platform.h"

namespace appsync {

class AppsClient;

/// What every preparation works on, and what it holds so far.
struct CoordinatedPreparation {
  AppsClient& client;
  platform::Platform& platform;
  const PlugInLog& log;
  const std::string identifier;

  std::shared_ptr<platform::InstallCoordinator> coordinator = nullptr;
  std::shared_ptr<platform::Placeholder> placeholder = nullptr;  ///< as long as it is not the coordinator's
  std::optional<Error> error = {};                               ///< the last one

  /// Notes how a step went, and says it. Returns whether it went well.
  bool report(const Status& outcome, PlugInLog::Format<std::string> done,
              PlugInLog::Format<Error, std::string> failed) {
    if (outcome) {
      log.message(done, identifier);
    } else {
      error = outcome.error();
      log.error(failed, outcome.error(), identifier);
    }
    return outcome.ok();
  }

  // Each gives up what is held of that, if anything.
  void cancelPlaceholder(const Error& reason) const {
    if (!placeholder) return;
    log.message("%s|Cancelling placeholder for appBundleIdentifier:%{public}@", identifier);
    placeholder->cancelForReason(reason, platform::ClientIdentity::CXClientSync).ignore();
  }
  void cancelCoordinator(const Error& reason) const {
    if (!coordinator) return;
    log.message("%s|Cancelling coordinator for appBundleIdentifier:%{public}@", identifier);
    coordinator->cancelForReason(reason, platform::ClientIdentity::CXClientSync).ignore();
  }
};

}  // namespace appsync
