// Removing an app through the install-coordination service.
#include "common/TransactionSteps.h"
#include "core/AppsClient.h"

namespace appsync {

namespace {

constexpr std::string_view kDescription = "Uninstall app";

}  // namespace

void AppsClient::uninstallAppUsingCoordination(std::string_view bundleIdentifier) {
  using platform::TransactionStep;
  platform::TransactionLog& transactions = _platform.transactionLog();
  beginStep(transactions, TransactionStep::uninstallApp, bundleIdentifier, kDescription);
  // The completion may outlive the object: it owns what it needs, but for the services.
  _platform.installCoordination().uninstallApp(
      bundleIdentifier, platform::UserConfirmation::skip,
      [&transactions, log = _log, identifier = std::string(bundleIdentifier)](const std::optional<Error>& error) {
        log.message("%s|Uninstall of %{public}@ with install coordinator succeeded wiht error %{public}@.", identifier,
                    error);
        endStep(transactions, TransactionStep::uninstallApp, !error, identifier, kDescription);
      });
}

}  // namespace appsync
