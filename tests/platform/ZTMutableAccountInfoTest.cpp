// The record of a store account.
#include <string>

#include <gtest/gtest.h>

#include "platform/ZTMutableAccountInfo.h"

namespace appsync::test {
namespace {

using platform::ZTAccountInfos;
using platform::ZTMutableAccountInfo;

ZTMutableAccountInfo account(std::string identifier) {
  ZTMutableAccountInfo info;
  info.setCorvelID(std::move(identifier));
  return info;
}

TEST(ZTMutableAccountInfo, IsInitiallyEmpty) {
  const ZTMutableAccountInfo info;
  EXPECT_EQ(info.DSID(), std::nullopt);
  EXPECT_EQ(info.corvelID(), "");
  EXPECT_EQ(info.altDSID(), std::nullopt);
}

TEST(ZTMutableAccountInfo, StoresItsValues) {
  ZTMutableAccountInfo info = account("a@example.org");
  info.setDSID(plist::Value(7));
  info.setAltDSID("000-7");
  EXPECT_EQ(info.DSID(), plist::Value(7));
  EXPECT_EQ(info.corvelID(), "a@example.org");
  EXPECT_EQ(info.altDSID(), "000-7");
}

TEST(ZTMutableAccountInfo, DescribesItsValues) {
  ZTMutableAccountInfo info = account("a@example.org");
  EXPECT_EQ(description(info), "<ZTMutableAccountInfo corvelID a@example.org DSID (null) altDSID (null)>");
  info.setDSID(plist::Value(7));
  info.setAltDSID("000-7");
  EXPECT_EQ(description(info), "<ZTMutableAccountInfo corvelID a@example.org DSID 7 altDSID 000-7>");
}

TEST(ZTMutableAccountInfo, EqualityComparesEveryField) {
  ZTMutableAccountInfo info = account("a");
  EXPECT_EQ(info, account("a"));
  EXPECT_NE(info, account("A"));
  info.setDSID(plist::Value(0));
  EXPECT_NE(info, account("a"));
  info.setDSID(std::nullopt);
  info.setAltDSID("");
  EXPECT_NE(info, account("a"));
}

TEST(ZTAccountInfos, AreOrderedByTheBytesOfTheIdentifier) {
  const ZTAccountInfos accounts{account("b"), account(""), account("\xc3\xa9"), account("B")};
  std::string order;
  for (const ZTMutableAccountInfo& info : accounts)
    order += info.corvelID() + ",";
  EXPECT_EQ(order, ",B,b,\xc3\xa9,");
}

TEST(ZTAccountInfos, KeepTheFirstOfEqualIdentifiers) {
  ZTMutableAccountInfo second = account("a");
  second.setDSID(plist::Value(2));
  ZTAccountInfos accounts{account("a")};
  accounts.insert(second);
  EXPECT_EQ(accounts, ZTAccountInfos{account("a")});
}

TEST(ZTAccountInfos, AreFoundByIdentifier) {
  const ZTAccountInfos accounts{account("a")};
  EXPECT_TRUE(accounts.contains(std::string_view("a")));
  EXPECT_FALSE(accounts.contains(std::string_view("A")));
}

}  // namespace
}  // namespace appsync::test
