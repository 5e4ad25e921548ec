#include "kit/fakes/Gate.h"

#include "kit/fakes/Patience.h"

namespace appsync::test {

void Gate::close() {
  const std::scoped_lock lock(mutex_);
  closed_ = true;
}

void Gate::open() {
  const std::scoped_lock lock(mutex_);
  closed_ = false;
  changed_.notify_all();
}

void Gate::pass() {
  std::unique_lock lock(mutex_);
  if (!closed_) return;
  ++stopped_;
  changed_.notify_all();
  awaitReady(
      changed_, lock, [this] { return !closed_; }, "a gate stays closed");
  --stopped_;
}

void Gate::waitUntilStopped(std::size_t count) {
  std::unique_lock lock(mutex_);
  awaitReady(
      changed_, lock, [&] { return stopped_ >= count; }, "too few threads come to a gate");
}

std::size_t Gate::stopped() const {
  const std::scoped_lock lock(mutex_);
  return stopped_;
}

}  // namespace appsync::test
