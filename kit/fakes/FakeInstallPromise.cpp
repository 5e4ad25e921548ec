#include <algorithm>
#include <sstream>

#include "kit/fakes/FakeInstallCoordinator.h"

namespace appsync::test {

using platform::ClientIdentity;
using platform::FileLocation;
using platform::PromisedOutOfBandTransfer;
using platform::PromisedTransferToPath;

namespace {

std::string textOf(double number) {
  std::ostringstream text;
  text << number;
  return text.str();
}

bool isOver(const FakePromise& promise) {
  return promise.cancellation || promise.hasEnded;
}

}  // namespace

template <class Interface>
template <class Change>
void FakeInstallPromise<Interface>::change(const Change& change) {
  state_->update([&] {
    if (!isOver(*promise_)) change();
  });
}

template <class Interface>
double FakeInstallPromise<Interface>::percentComplete() const {
  if (state_->begin("promise.percentComplete", promise_->name)) return 0;
  return state_->read([&] { return promise_->percentComplete; });
}

template <class Interface>
void FakeInstallPromise<Interface>::setPercentComplete(double fraction) {
  if (state_->begin("promise.setPercentComplete", promise_->name, textOf(fraction))) return;
  change([&] { promise_->percentComplete = std::clamp(fraction, 0.0, 1.0); });
}

template <class Interface>
bool FakeInstallPromise<Interface>::isComplete() const {
  if (state_->begin("promise.isComplete", promise_->name)) return false;
  return state_->read([&] { return promise_->isComplete; });
}

template <class Interface>
void FakeInstallPromise<Interface>::setComplete(bool complete) {
  if (state_->begin("promise.setComplete", promise_->name, complete ? "" : "no")) return;
  change([&] { promise_->isComplete = promise_->isComplete || complete; });
}

template <class Interface>
Status FakeInstallPromise<Interface>::cancelForReason(const Error& reason, ClientIdentity client) {
  if (auto failure = state_->begin("promise.cancelForReason", promise_->name, textOf(reason, client))) {
    return *std::move(failure);
  }
  return state_->change([&]() -> Status {
    if (promise_->isAttached && client != promise_->client) return coordinationError("the promise is another client's");
    if (promise_->isTaken) return coordinationError("the app is being installed");
    if (!isOver(*promise_)) promise_->cancellation = FakeCancellation{reason, client};
    return {};
  });
}

std::optional<FileLocation> FakePromisedTransferToPath::transferPath() const {
  if (state_->begin("promise.transferPath", promise_->name)) return std::nullopt;
  return state_->read([&] { return promise_->transferPath; });
}

void FakePromisedTransferToPath::setTransferPath(const FileLocation& path) {
  if (state_->begin("promise.setTransferPath", promise_->name, path.path)) return;
  change([&] {
    if (!promise_->isComplete) promise_->transferPath = path;
  });
}

template class FakeInstallPromise<PromisedTransferToPath>;
template class FakeInstallPromise<PromisedOutOfBandTransfer>;

}  // namespace appsync::test
