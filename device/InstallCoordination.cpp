#include "device/InstallCoordination.h"

namespace appsync::device {

namespace {

/// Without coordinators there is nothing to tell the delegate.
class IdleObserver final : public platform::InstallObserver {};

Error coordinationIsOff() {
  return {std::string(platform::kInstallCoordinationErrorDomain), 2, "install coordination is off on this device",
          nullptr};
}

}  // namespace

std::shared_ptr<platform::InstallCoordinator> InstallCoordination::coordinatorForApp(platform::CoordinatorKind,
                                                                                     std::string_view,
                                                                                     platform::ClientIdentity,
                                                                                     platform::IfMissing, bool*,
                                                                                     ErrorSlot error) {
  setError(error, coordinationIsOff());
  return nullptr;
}

std::shared_ptr<platform::Placeholder> InstallCoordination::initAppPlaceholder(std::string_view, std::string_view,
                                                                               platform::TSInstallType,
                                                                               platform::ClientIdentity) {
  return nullptr;
}

std::shared_ptr<platform::PromisedTransferToPath> InstallCoordination::makePromisedTransferToPath(
    std::string_view, platform::ClientIdentity, const std::optional<platform::FileLocation>&, std::uint64_t) {
  return nullptr;
}

std::shared_ptr<platform::PromisedOutOfBandTransfer> InstallCoordination::makePromisedOutOfBandTransfer(
    std::string_view, platform::ClientIdentity, std::uint64_t) {
  return nullptr;
}

void InstallCoordination::uninstallApp(std::string_view, platform::UserConfirmation, UninstallCompletion completion) {
  completion(coordinationIsOff());
}

Error InstallCoordination::createUserPresentableError(long code, const plist::Dictionary&, const Error& underlying) {
  return {std::string(platform::kInstallCoordinationErrorDomain), code, underlying.text,
          std::make_shared<const Error>(underlying)};
}

std::unique_ptr<platform::InstallObserver> InstallCoordination::initWithMachServiceName(
    std::string_view, const std::set<platform::ClientIdentity>&, platform::InstallObserverDelegate&) {
  return std::make_unique<IdleObserver>();
}

}  // namespace appsync::device
