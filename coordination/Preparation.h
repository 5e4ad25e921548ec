// The state that the steps of a coordinated install or restore share.
#pragma once

#include <memory>
#include <optional>
#include <string>

#include "base/Error.h"
#include "common/PlugInLog.h"
#include "core/AppsClient.h"
#include "platform/Platform.h"

namespace appsync {

/// Whether an icon belongs to an install or to a restore, which fail with different errors.
enum class IconOwner { install, restore };

/// The app of one preparation, and what has been made for it.
struct CoordinatedPreparation {
  AppsClient& client;
  platform::Platform& platform;
  const PlugInLog& log;
  const std::string identifier;

  std::shared_ptr<platform::InstallCoordinator> coordinator = nullptr;
  std::shared_ptr<platform::Placeholder> placeholder = nullptr;  ///< null once it is the coordinator's
  std::optional<Error> error = {};                               ///< the last one

  /// Logs the outcome of a step, and keeps its error. Returns whether the step succeeded.
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

  /// Attaches the icon file to the placeholder. Returns true also if there is no icon, that is, if `size` is 0.
  [[nodiscard]] bool attachIcon(const std::string& path, std::uint64_t size, IconOwner owner) const {
    return size == 0 || client._createIconPromiseForBundleIdentifier(identifier, path, size, placeholder,
                                                                     owner == IconOwner::install) != nullptr;
  }

  // Do nothing if there is none.
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
