#include "daemon/PendingInstalls.h"

#include <algorithm>
#include <utility>

#include "host/Ticker.h"

namespace appsync::daemon {
namespace {

constexpr std::size_t kMostPackages = 64;
constexpr std::uint64_t kMostBytes = std::uint64_t{256} << 20;

}  // namespace

void PendingInstalls::add(PendingInstall package) {
  const std::lock_guard lock(mutex_);
  bytes_ += package.bytes;
  packages_.push_back(std::move(package));
}

bool PendingInstalls::settle(const std::function<std::optional<host::AppOutcome>(const PendingInstall&)>& outcomeOf) {
  const std::lock_guard lock(mutex_);
  const std::size_t settled = std::erase_if(packages_, [&](const PendingInstall& package) {
    const std::optional<host::AppOutcome> outcome = outcomeOf(package);
    if (!outcome) return false;
    bytes_ -= package.bytes;
    progress_.finish(*outcome);
    return true;
  });
  if (settled > 0) settled_.notify_all();
  return settled > 0;
}

std::vector<PendingInstall> PendingInstalls::first(std::size_t most) const {
  const std::lock_guard lock(mutex_);
  const auto count = static_cast<std::ptrdiff_t>(std::min(most, packages_.size()));
  return {packages_.begin(), packages_.begin() + count};
}

void PendingInstalls::waitForSpace(std::uint64_t bytes, const host::InterruptSignals& interruption) const {
  std::unique_lock lock(mutex_);
  const auto hasSpace = [&] {
    return packages_.empty() || (packages_.size() < kMostPackages && bytes_ + bytes <= kMostBytes);
  };
  // A signal does not notify the condition variable.
  while (!hasSpace() && !interruption.requested())
    settled_.wait_for(lock, host::kTimeBetweenLooks, hasSpace);
}

}  // namespace appsync::daemon
