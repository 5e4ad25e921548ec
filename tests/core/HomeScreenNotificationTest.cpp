// What the home screen hears of a sync, and the order of its icons.
#include <cerrno>
#include <functional>
#include <map>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include <gtest/gtest.h>

#include "kit/fakes/CallsInLog.h"
#include "kit/fakes/SyncFileBuilder.h"
#include "tests/support/ClientFixture.h"

namespace appsync::test {

namespace {

constexpr std::string_view kSortOrder = "/var/mobile/Library/ApplicationSync/AssetSortOrder.plist";
constexpr std::string_view kNotification = "com.corvel.solvary.zeph.wsyncnotify";

using Items = std::map<std::string, int, std::less<>>;

class NotifySolvary : public ClientFixture {};

class OrderTheItems : public ClientFixture {
 protected:
  OrderTheItems() { platform.files.putFolder("/var/mobile/Library/ApplicationSync"); }

  std::vector<int> order(Items& items) { return AppsClient::_orderTheItems(platform, items); }
};

}  // namespace

TEST_F(NotifySolvary, AStartIsPostedWithStateOne) {
  logCalls(platform);
  AppsClient::_notifySolvary(platform, true);
  EXPECT_TRUE(
      sameLines(LogLines{called("systemNotify.registerCheck com.corvel.solvary.zeph.wsyncnotify"),
                         logged("Notifying SV we are starting syncing"), called("homeScreen.blockableServerPort"),
                         called("systemNotify.setState com.corvel.solvary.zeph.wsyncnotify 1"),
                         called("systemNotify.post com.corvel.solvary.zeph.wsyncnotify")},
                platform.log.lines()));
  EXPECT_EQ(platform.notify.posts(), (std::vector<Post>{{std::string(kNotification), 1}}));
}

TEST_F(NotifySolvary, AnEndIsPostedWithStateZero) {
  AppsClient::_notifySolvary(platform, true);
  AppsClient::_notifySolvary(platform, false);
  EXPECT_TRUE(
      sameLines(LogLines{logged("Notifying SV we are starting syncing"), logged("Notifying SV we are done syncing")},
                platform.log.lines()));
  EXPECT_EQ(platform.notify.posts(),
            (std::vector<Post>{{std::string(kNotification), 1}, {std::string(kNotification), 0}}));
}

TEST_F(NotifySolvary, AFailedRegistrationIsLoggedAndNothingIsPosted) {
  platform.notify.failRegistrationsWith(1'000'000);
  logCalls(platform);
  AppsClient::_notifySolvary(platform, false);
  EXPECT_TRUE(sameLines(LogLines{called("systemNotify.registerCheck com.corvel.solvary.zeph.wsyncnotify"),
                                 logged("Notifying SV we are done syncing"), called("homeScreen.blockableServerPort"),
                                 loggedError("Uh Oh...can't send notification to SV:1000000")},
                        platform.log.lines()));
  EXPECT_TRUE(platform.notify.posts().empty());
}

TEST_F(OrderTheItems, ItemsOnTheHomeScreenComeFirstInItsOrder) {
  platform.screen.setFlattenedIconState(std::vector<std::string>{"com.z", "com.other", "com.m"});
  Items items{{"com.a", 1}, {"com.m", 2}, {"com.z", 3}};
  logCalls(platform);
  EXPECT_EQ(order(items), (std::vector<int>{3, 2, 1}));
  EXPECT_TRUE(sameLines(
      LogLines{called("homeScreen.blockableServerPort"), called("homeScreen.getFlattenedIconState"),
               logged("saved icon sort order"),
               called("fileSystem.writeFileAtomically /var/mobile/Library/ApplicationSync/AssetSortOrder.plist"),
               logged("prioritize com.z"), logged("prioritize com.m"), logged("lastly com.a")},
      platform.log.lines()));
}

TEST_F(OrderTheItems, WithoutAnIconStateEveryItemIsReturnedOnceAndTheOrderIsNotRewritten) {
  platform.files.put(kSortOrder, "as it was");
  Items items{{"com.a", 1}, {"com.b", 2}};
  EXPECT_EQ(order(items), (std::vector<int>{1, 2}));
  EXPECT_TRUE(
      sameLines(LogLines{logged("got no icon sort order from SV"), logged("lastly com.a"), logged("lastly com.b")},
                platform.log.lines()));
  EXPECT_EQ(platform.files.text(kSortOrder), "as it was");
  EXPECT_EQ(platform.journal.count("fileSystem."), 0U);
}

TEST_F(OrderTheItems, EmptyIconStateCountsAsNone) {
  platform.files.put(kSortOrder, "as it was");
  platform.screen.setFlattenedIconState(Bytes());
  Items items{{"com.a", 1}};
  EXPECT_EQ(order(items), std::vector<int>{1});
  EXPECT_TRUE(
      sameLines(LogLines{logged("got no icon sort order from SV"), logged("lastly com.a")}, platform.log.lines()));
  EXPECT_EQ(platform.files.text(kSortOrder), "as it was");
}

TEST_F(OrderTheItems, WithoutItemsTheIconStateIsStillSaved) {
  platform.screen.setFlattenedIconState(std::vector<std::string>{"com.a"});
  Items items;
  EXPECT_TRUE(order(items).empty());
  EXPECT_TRUE(sameLines(LogLines{logged("saved icon sort order")}, platform.log.lines()));
  EXPECT_TRUE(platform.files.has(kSortOrder));
}

TEST_F(OrderTheItems, TheIconStateIsSavedByteForByte) {
  const std::string bytes("\x00\x01 whatever the home screen said \xff", 33);
  platform.screen.setFlattenedIconState(Bytes(bytesOf(bytes).begin(), bytesOf(bytes).end()));
  Items items;
  EXPECT_TRUE(order(items).empty());
  EXPECT_EQ(platform.files.text(kSortOrder), bytes);
}

TEST_F(OrderTheItems, AnOrderThatCannotBeSavedStillCounts) {
  platform.screen.setFlattenedIconState(std::vector<std::string>{"com.b"});
  platform.files.failures.failNext(FileOperation::writeFileAtomically, kSortOrder, Error::fromErrno(ENOSPC));
  Items items{{"com.a", 1}, {"com.b", 2}};
  EXPECT_EQ(order(items), (std::vector<int>{2, 1}));
}

TEST_F(OrderTheItems, AnIconStateThatDoesNotParseIsAnEmptyOrder) {
  platform.screen.setFlattenedIconState(Bytes(3, std::byte{0xff}));
  Items items{{"com.a", 1}};
  EXPECT_EQ(order(items), std::vector<int>{1});
  EXPECT_TRUE(sameLines(LogLines{logged("saved icon sort order"), logged("lastly com.a")}, platform.log.lines()));
}

TEST_F(OrderTheItems, AnIconStateThatIsNoArrayIsAnEmptyOrder) {
  platform.screen.setFlattenedIconState(xmlForm(plist::Dictionary{{"com.a", 1}}));
  Items items{{"com.a", 1}};
  EXPECT_EQ(order(items), std::vector<int>{1});
}

TEST_F(OrderTheItems, ElementsOfTheOrderThatAreNoIdentifiersArePassedOver) {
  platform.screen.setFlattenedIconState(
      binaryForm(plist::Array{7, plist::Array{"com.a"}, plist::Dictionary{{"com.a", 1}}, "", "com.b"}));
  Items items{{"com.a", 1}, {"com.b", 2}};
  EXPECT_EQ(order(items), (std::vector<int>{2, 1}));
}

TEST_F(OrderTheItems, AnIdentifierThatStandsTwiceOnTheHomeScreenIsPlacedOnce) {
  platform.screen.setFlattenedIconState(std::vector<std::string>{"com.a", "com.b", "com.a"});
  Items items{{"com.a", 1}, {"com.b", 2}};
  EXPECT_EQ(order(items), (std::vector<int>{1, 2}));
  EXPECT_TRUE(
      sameLines(LogLines{logged("saved icon sort order"), logged("prioritize com.a"), logged("prioritize com.b")},
                platform.log.lines()));
}

TEST_F(OrderTheItems, PlacedItemsLeaveTheDictionaryAndOthersStay) {
  platform.screen.setFlattenedIconState(std::vector<std::string>{"com.b"});
  Items items{{"com.a", 1}, {"com.b", 2}, {"com.c", 3}};
  static_cast<void>(order(items));
  EXPECT_EQ(items, (Items{{"com.a", 1}, {"com.c", 3}}));
}

TEST_F(OrderTheItems, EveryItemOnTheHomeScreenComesBeforeEveryItemThatIsNot) {
  std::vector<std::string> icons;
  Items items;
  for (int number = 0; number < 100; ++number) {
    const std::string identifier = "com.app" + std::to_string(number);
    items.emplace(identifier, number);
    if (number % 3 == 0) icons.insert(icons.begin(), identifier);
  }
  platform.screen.setFlattenedIconState(icons);
  const std::vector<int> ordered = order(items);
  ASSERT_EQ(ordered.size(), 100U);
  for (std::size_t place = 0; place < ordered.size(); ++place)
    EXPECT_EQ(ordered[place] % 3 == 0, place < icons.size()) << place;
  EXPECT_EQ(ordered.front(), 99);
}

TEST_F(OrderTheItems, AnyKindOfItemIsOrdered) {
  platform.screen.setFlattenedIconState(std::vector<std::string>{"com.b"});
  std::map<std::string, std::shared_ptr<std::string>, std::less<>> items{{"com.a", std::make_shared<std::string>("a")},
                                                                         {"com.b", std::make_shared<std::string>("b")}};
  const auto ordered = AppsClient::_orderTheItems(platform, items);
  ASSERT_EQ(ordered.size(), 2U);
  EXPECT_EQ(*ordered[0], "b");
  EXPECT_EQ(*ordered[1], "a");
}

}  // namespace appsync::test
