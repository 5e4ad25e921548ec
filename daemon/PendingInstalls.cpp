#include "daemon/PendingInstalls.h"

#include <algorithm>
#include <utility>

namespace appsync::daemon {
namespace {

using namespace std::chrono_literals;

constexpr std::size_t kMostPackages = 64;
constexpr std::uint64_t kMostBytes = std::uint64_t{256} << 20;
/// An interruption wakes nobody.
constexpr auto kTimeBetweenLooks = 20ms;

}  // namespace

void SentPackages::add(SentPackage package) {
  const std::lock_guard lock(mutex_);
  bytes_ += package.bytes;
  packages_.push_back(std::move(package));
}

bool SentPackages::settle(const std::function<std::optional<host::AppOutcome>(const SentPackage&)>& outcomeOf) {
  const std::lock_guard lock(mutex_);
  const std::size_t settled = std::erase_if(packages_, [&](const SentPackage& package) {
    const std::optional<host::AppOutcome> outcome = outcomeOf(package);
    if (!outcome) return false;
    bytes_ -= package.bytes;
    progress_.finish(*outcome);
    return true;
  });
  if (settled > 0) settled_.notify_all();
  return settled > 0;
}

std::vector<SentPackage> SentPackages::first(std::size_t most) const {
  const std::lock_guard lock(mutex_);
  const auto count = static_cast<std::ptrdiff_t>(std::min(most, packages_.size()));
  return {packages_.begin(), packages_.begin() + count};
}

void SentPackages::waitForRoom(std::uint64_t bytes, const host::Interruption& interruption) const {
  std::unique_lock lock(mutex_);
  const auto hasRoom = [&] {
    return packages_.empty() || (packages_.size() < kMostPackages && bytes_ + bytes <= kMostBytes);
  };
  while (!hasRoom() && !interruption.requested())
    settled_.wait_for(lock, kTimeBetweenLooks, hasRoom);
}

}  // namespace appsync::daemon
