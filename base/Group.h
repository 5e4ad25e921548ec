// Counts pending operations and waits for all of them.
#pragma once

#include <condition_variable>
#include <cstdint>
#include <memory>
#include <mutex>
#include <utility>

#include "base/Clock.h"

namespace appsync {

/// Thread-safe. The group may be destroyed as soon as a wait has returned true, although
/// the `leave` that ended it may still be returning on another thread.
class Group {
 public:
  /// `clock` must outlive the group.
  explicit Group(Clock& clock) : clock_(clock) {}
  Group(const Group&) = delete;
  Group& operator=(const Group&) = delete;

  void enter();

  /// Throws std::logic_error, and changes nothing, if the group is empty.
  void leave();

  /// Blocks until the group is empty or has been empty since the call.
  void wait();

  /// Blocks until the group is empty or has been empty since the call. Returns false if `deadline` is reached first.
  bool wait(TimePoint deadline);

  /// Returns the number of enters without a leave.
  std::int64_t count() const;

 private:
  Clock& clock_;
  mutable std::mutex mutex_;
  std::condition_variable emptied_;
  std::int64_t count_ = 0;
  /// How often the group became empty: a waiter returns even if the group is entered again before the waiter wakes.
  std::uint64_t timesEmptied_ = 0;
};

/// Enters a group, leaves it on destruction, and shares its ownership until then.
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
