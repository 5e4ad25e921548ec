#include "daemon/TransferQueue.h"

#include <algorithm>
#include <cerrno>
#include <optional>
#include <utility>

namespace appsync::daemon {
namespace {

using platform::ZTAsset;

auto isOf(std::string_view identifier) {
  return [identifier](const std::shared_ptr<ZTAsset>& asset) { return asset->identifier() == identifier; };
}

Error notWaiting(const std::string& identifier) {
  return {std::string(domains::kPOSIX), ENOENT, identifier + " is not among the packages that are still to be sent",
          nullptr};
}

}  // namespace

void TransferQueue::fill(const platform::Assets& assets) {
  const std::lock_guard lock(mutex_);
  isFilled_ = true;
  for (const auto& asset : assets) {
    if (!cancelled_.contains(asset->identifier())) waiting_.push_back(asset);
  }
  for (const std::string& identifier : prioritizedBeforeFill_)
    moveToFront(identifier);
}

std::shared_ptr<ZTAsset> TransferQueue::front() const {
  const std::lock_guard lock(mutex_);
  return waiting_.empty() ? nullptr : waiting_.front();
}

std::shared_ptr<ZTAsset> TransferQueue::take() {
  const std::lock_guard lock(mutex_);
  if (waiting_.empty()) return nullptr;
  std::shared_ptr<ZTAsset> next = std::move(waiting_.front());
  waiting_.pop_front();
  return next;
}

bool TransferQueue::wasCancelled(std::string_view identifier) const {
  const std::lock_guard lock(mutex_);
  return cancelled_.contains(identifier);
}

bool TransferQueue::supports(Operation /*operation*/) {
  return true;
}

void TransferQueue::prioritizeAsset(const std::shared_ptr<ZTAsset>& asset, Completion completion) {
  std::optional<Error> error;
  {
    const std::lock_guard lock(mutex_);
    if (!isFilled_) {
      prioritizedBeforeFill_.push_back(asset->identifier());
    } else if (!moveToFront(asset->identifier())) {
      error = notWaiting(asset->identifier());
    }
  }
  completion(error);
}

void TransferQueue::cancelAssetTransferForFailedAsset(const std::shared_ptr<ZTAsset>& asset) {
  const std::lock_guard lock(mutex_);
  cancelled_.insert(asset->identifier());
  std::erase_if(waiting_, isOf(asset->identifier()));
}

bool TransferQueue::moveToFront(std::string_view identifier) {
  const auto found = std::ranges::find_if(waiting_, isOf(identifier));
  if (found == waiting_.end()) return false;
  std::rotate(waiting_.begin(), found, found + 1);
  return true;
}

}  // namespace appsync::daemon
