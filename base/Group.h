// Counts things under way, and waits for all of them.
#pragma once

#include <condition_variable>
#include <cstdint>
#include <memory>
#include <mutex>
#include <utility>

#include "base/Clock.h"

namespace appsync {

/// All operations may be called on any thread. The group may be destroyed as soon as a wait has returned true, although
/// the `leave` that ended it may still be returning on another thread.
class Group {
 public:
  /// `clock` must outlive the group.
  explicit Group(Clock& clock) : clock_(clock) {}
  Group(const Group&) = delete;
  Group& operator=(const Group&) = delete;

  void enter();

  /// Throws std::logic_error, and changes nothing, if there is no enter left to take back.
  void leave();

  /// Returns once the group is empty, or has been since the call.
  void wait();

  /// The same until the clock reads `deadline`; false if the group was not empty until then.
  bool wait(TimePoint deadline);

  /// How many enters have not been taken back.
  std::int64_t count() const;

 private:
  Clock& clock_;
  mutable std::mutex mutex_;
  std::condition_variable emptied_;
  std::int64_t count_ = 0;
  /// How often the group has become empty: a waiter returns even if it is entered anew before the waiter wakes.
  std::uint64_t timesEmptied_ = 0;
};

/// Enters a group now, leaves it when destroyed, and keeps it until then. Moving hands the duty to leave on.
class [[nodiscard]] GroupEntry {
 public:
  explicit GroupEntry(std::shared_ptr<Group> group) : group_(std::move(group)) { group_->enter(); }
  GroupEntry(GroupEntry&&) noexcept = default;
  GroupEntry& operator=(GroupEntry other) noexcept {
    std::swap(group_, other.group_);
    return *this;
  }
  ~GroupEntry() {
    if (group_ != nullptr) group_->leave();
  }

 private:
  std::shared_ptr<Group> group_;
};

}  // namespace appsync
