#include "device/coordination/PromiseHandles.h"

namespace appsync::device {

std::shared_ptr<PromiseState> stateOf(const Coordinators& coordinators,
                                      const std::shared_ptr<platform::InstallPromise>& promise) {
  if (const auto* transfer = dynamic_cast<const TransferToPathPromise*>(promise.get())) {
    return transfer->stateIn(coordinators);
  }
  if (const auto* outOfBand = dynamic_cast<const OutOfBandPromise*>(promise.get())) {
    return outOfBand->stateIn(coordinators);
  }
  return nullptr;
}

}  // namespace appsync::device
