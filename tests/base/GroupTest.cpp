#include <memory>
#include <stdexcept>
#include <thread>
#include <type_traits>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "base/Group.h"
#include "base/SystemClock.h"
#include "base/VirtualTime.h"

namespace appsync::test {
namespace {

using namespace std::chrono_literals;

class GroupTest : public testing::Test {
 protected:
  VirtualTime time;
  Group group{time};
};

TEST_F(GroupTest, CountsEntersWithoutLeave) {
  EXPECT_EQ(group.count(), 0);
  group.enter();
  group.enter();
  EXPECT_EQ(group.count(), 2);
  group.leave();
  EXPECT_EQ(group.count(), 1);
  group.leave();
}

TEST_F(GroupTest, ThrowsOnLeaveWithoutEnter) {
  EXPECT_THROW(group.leave(), std::logic_error);
  EXPECT_EQ(group.count(), 0);
  group.enter();
  group.leave();
  EXPECT_THROW(group.leave(), std::logic_error);
}

TEST_F(GroupTest, DoesNotWaitWhileEmpty) {
  group.wait();
  EXPECT_TRUE(group.wait(time.now()));
  EXPECT_TRUE(group.wait(time.now() - 1h));
}

TEST_F(GroupTest, WaitsForTheLastLeave) {
  group.enter();
  group.enter();
  bool left = false;
  std::thread other([&] {
    group.leave();
    left = true;
    group.leave();
  });
  group.wait();
  EXPECT_TRUE(left);
  other.join();
}

TEST_F(GroupTest, WaitEndsAtDeadlineAndKeepsCount) {
  group.enter();
  EXPECT_FALSE(group.wait(time.now()));
  std::thread waiter([&] { EXPECT_FALSE(group.wait(time.now() + 5s)); });
  time.waitUntilWaiting(1);
  time.advance(5s);
  waiter.join();
  EXPECT_EQ(group.count(), 1);
}

TEST_F(GroupTest, ReturnsBeforeTheDeadlineWhenItBecomesEmpty) {
  group.enter();
  std::thread waiter([&] { EXPECT_TRUE(group.wait(time.now() + 5s)); });
  time.waitUntilWaiting(1);
  group.leave();
  waiter.join();
  EXPECT_EQ(time.now(), TimePoint());
}

TEST_F(GroupTest, WakesAllWaiters) {
  group.enter();
  std::vector<std::thread> waiters(3);
  for (std::thread& waiter : waiters)
    waiter = std::thread([&] { EXPECT_TRUE(group.wait(time.now() + 5s)); });
  time.waitUntilWaiting(3);
  group.leave();
  for (std::thread& waiter : waiters)
    waiter.join();
}

TEST_F(GroupTest, WaiterSeesEmptyGroupDespiteImmediateEnter) {
  group.enter();
  std::thread waiter([&] { EXPECT_TRUE(group.wait(time.now() + 5s)); });
  time.waitUntilWaiting(1);
  group.leave();
  group.enter();
  waiter.join();
  EXPECT_FALSE(group.wait(time.now()));
}

TEST_F(GroupTest, ATaskLeavesItLater) {
  group.enter();
  time.after(30s, [&] { group.leave(); });
  time.advance(30s);
  EXPECT_TRUE(group.wait(time.now()));
}

TEST(Group, MayBeDestroyedRightAfterItsWait) {
  SystemClock clock;
  for (int round = 0; round < 500; ++round) {
    auto group = std::make_unique<Group>(clock);
    group->enter();
    std::thread other([leaving = group.get()] { leaving->leave(); });
    group->wait();
    group.reset();
    other.join();
  }
}

class GroupEntryTest : public testing::Test {
 protected:
  VirtualTime time;
  std::shared_ptr<Group> group = std::make_shared<Group>(time);
};

TEST_F(GroupEntryTest, EntersNowAndLeavesWhenDestroyed) {
  {
    const GroupEntry entry(group);
    EXPECT_EQ(group->count(), 1);
  }
  EXPECT_EQ(group->count(), 0);
}

TEST_F(GroupEntryTest, MoveTransfersTheLeave) {
  std::unique_ptr<GroupEntry> moved;
  {
    GroupEntry entry(group);
    moved = std::make_unique<GroupEntry>(std::move(entry));
  }
  EXPECT_EQ(group->count(), 1);
  moved.reset();
  EXPECT_EQ(group->count(), 0);
}

TEST_F(GroupEntryTest, AssignmentLeavesThePreviousGroup) {
  const auto other = std::make_shared<Group>(time);
  GroupEntry entry(group);
  entry = GroupEntry(other);
  EXPECT_EQ(group->count(), 0);
  EXPECT_EQ(other->count(), 1);
}

TEST_F(GroupEntryTest, KeepsItsGroup) {
  const std::weak_ptr<Group> kept = group;
  {
    const GroupEntry entry(std::exchange(group, nullptr));
    EXPECT_FALSE(kept.expired());
  }
  EXPECT_TRUE(kept.expired());
}

static_assert(!std::is_copy_constructible_v<GroupEntry> && std::is_nothrow_move_constructible_v<GroupEntry>);

}  // namespace
}  // namespace appsync::test
