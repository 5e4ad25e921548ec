// Small questions to property lists that come from outside.
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "plist/Access.h"

namespace appsync::test {

using plist::booleanIn;
using plist::entryHas;
using plist::keysOf;

TEST(PropertyListAccess, ConvertsBooleansNumbersAndWordsToTrue) {
  for (const plist::Value& value : {plist::Value(true), plist::Value(1), plist::Value(-0.5), plist::Value("yes"),
                                    plist::Value("True"), plist::Value("12")})
    EXPECT_TRUE(booleanIn(&value));
}

TEST(PropertyListAccess, ConvertsOtherValuesToFalse) {
  EXPECT_FALSE(booleanIn(nullptr));
  for (const plist::Value& value :
       {plist::Value(), plist::Value(false), plist::Value(0), plist::Value("no"), plist::Value(""),
        plist::Value(plist::Array{true}), plist::Value(plist::Date{1}), plist::Value::data(bytesOf("yes"))})
    EXPECT_FALSE(booleanIn(&value));
}

TEST(PropertyListAccess, ComparesTextOfEntriesExactly) {
  const plist::Value entry(plist::Dictionary{{"operation", "remove"}, {"number", 7}});
  EXPECT_TRUE(entryHas(entry, "operation", "remove"));
  EXPECT_FALSE(entryHas(entry, "operation", "Remove"));
  EXPECT_FALSE(entryHas(entry, "number", "7"));
  EXPECT_FALSE(entryHas(entry, "absent", ""));
  EXPECT_FALSE(entryHas("operation", "operation", "remove"));
}

TEST(PropertyListAccess, ReturnsKeysInOrder) {
  EXPECT_EQ(keysOf({{"b", 1}, {"a", 2}, {"", 3}}), (std::vector<std::string>{"", "a", "b"}));
  EXPECT_TRUE(keysOf({}).empty());
}

}  // namespace appsync::test
