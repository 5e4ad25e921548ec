#include "device/InstallPromises.h"

namespace appsync::device {

std::shared_ptr<PromiseState> stateOf(const Coordinators& coordinators,
                                      const std::shared_ptr<platform::InstallPromise>& promise) {
  if (const auto* transfer = dynamic_cast<const TransferToPathPromise*>(promise.get())) {
    return transfer->isOf(coordinators) ? transfer->state() : nullptr;
  }
  if (const auto* outOfBand = dynamic_cast<const OutOfBandPromise*>(promise.get())) {
    return outOfBand->isOf(coordinators) ? outOfBand->state() : nullptr;
  }
  return nullptr;
}

}  // namespace appsync::device
