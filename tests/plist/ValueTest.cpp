#include <cmath>
#include <limits>
#include <thread>

#include <gtest/gtest.h>

#include "kit/fakes/Threads.h"
#include "plist/Access.h"
#include "plist/PropertyList.h"

namespace appsync::test {

namespace {

using plist::Array;
using plist::Date;
using plist::Dictionary;
using plist::Type;
using plist::Uid;
using plist::Value;

TEST(PropertyListValue, IsNullWithoutContent) {
  EXPECT_TRUE(Value().isNull());
  EXPECT_TRUE(Value(nullptr).isNull());
  EXPECT_EQ(Value().type(), Type::null);
}

TEST(PropertyListValue, ConvertsCharacterPointerToString) {
  EXPECT_EQ(Value("x").type(), Type::string);
  EXPECT_EQ(Value(true).type(), Type::boolean);
  EXPECT_EQ(Value(1).type(), Type::integer);
  EXPECT_EQ(Value(1.0F).type(), Type::real);
}

TEST(PropertyListValue, HoldsTheWholeSignedAndUnsignedRange) {
  EXPECT_EQ(Value(INT64_MIN).int64(), INT64_MIN);
  EXPECT_EQ(Value(INT64_MIN).uint64(), std::nullopt);
  EXPECT_EQ(Value(UINT64_MAX).uint64(), UINT64_MAX);
  EXPECT_EQ(Value(UINT64_MAX).int64(), std::nullopt);
  EXPECT_EQ(Value(UINT64_MAX).number(), 18446744073709551615.0);
  EXPECT_EQ(Value(std::int8_t{-1}), Value(-1));
  EXPECT_NE(Value(UINT64_MAX), Value(-1));
  EXPECT_EQ(Value(std::uint64_t{7}).int64(), 7);
}

TEST(PropertyListValue, ReturnsNulloptForAnotherType) {
  const Value text("1");
  EXPECT_EQ(text.boolean(), std::nullopt);
  EXPECT_EQ(text.int64(), std::nullopt);
  EXPECT_EQ(text.number(), std::nullopt);
  EXPECT_FALSE(text.data().has_value());
  EXPECT_EQ(text.date(), std::nullopt);
  EXPECT_EQ(text.uid(), std::nullopt);
  EXPECT_EQ(text.array(), nullptr);
  EXPECT_EQ(text.dictionary(), nullptr);
  EXPECT_EQ(text.find("1"), nullptr);
  EXPECT_EQ(Value(1).string(), std::nullopt);
}

TEST(PropertyListValue, KeepsTextAndDataOfEveryLength) {
  for (std::size_t size = 0; size < 70; ++size) {
    const std::string text(size, 'x');
    const Value string(text);
    const Value data = Value::data(bytesOf(text));
    EXPECT_EQ(string.string(), text);
    EXPECT_EQ(appsync::textOf(*data.data()), text);
    EXPECT_EQ(data, Value(Bytes(size, std::byte{'x'})));
    EXPECT_NE(string, data);
    EXPECT_EQ(Value(string), string);
  }
}

TEST(PropertyListValue, CopiesAreIndependent) {
  Value first = Dictionary{{"list", Array{1, 2}}, {"name", "a"}};
  const Value copy = first;
  first.dictionary()->find("list")->array()->push_back(3);
  first.dictionary()->set("name", "b");
  first.dictionary()->set("more", true);
  EXPECT_EQ(copy, Value(Dictionary{{"list", Array{1, 2}}, {"name", "a"}}));
  EXPECT_EQ(first, Value(Dictionary{{"list", Array{1, 2, 3}}, {"name", "b"}, {"more", true}}));
}

TEST(PropertyListValue, AcceptsAssignmentOfItsOwnPart) {
  Value value = Dictionary{{"inner", Dictionary{{"text", "a text that does not fit into thirty bytes"}}}};
  value = *value.find("inner");
  value = *value.find("text");
  EXPECT_EQ(value, Value("a text that does not fit into thirty bytes"));
}

TEST(PropertyListValue, ThreadsMayUseAndChangeCopiesOfOneValue) {
  const Value shared = Dictionary{{"list", Array{std::string(100, 'x'), Dictionary{{"key", 1}}}}};
  runOnThreads(4, [&](std::size_t index) {
    for (int round = 0; round < 1000; ++round) {
      Value mine = shared;
      mine.dictionary()->find("list")->array()->push_back(index);
      EXPECT_EQ(mine.find("list")->array()->size(), 3U);
    }
  });
  EXPECT_EQ(shared.find("list")->array()->size(), 2U);
}

TEST(PropertyListValue, ValuesOfDifferentTypesAreNotEqual) {
  EXPECT_NE(Value(1), Value(1.0));
  EXPECT_NE(Value(1), Value(true));
  EXPECT_NE(Value(Uid{1}), Value(1));
  EXPECT_NE(Value(Date{1}), Value(1.0));
  EXPECT_NE(Value(Array{}), Value(Dictionary{}));
  EXPECT_NE(Value(), Value(false));
}

TEST(PropertyListValue, NaNEqualsNaN) {
  const double nan = std::numeric_limits<double>::quiet_NaN();
  EXPECT_EQ(Value(nan), Value(-nan));
  EXPECT_EQ(Value(Array{nan}), Value(Array{nan}));
  EXPECT_NE(Value(nan), Value(0.0));
  EXPECT_EQ(Value(0.0), Value(-0.0));
}

TEST(PropertyListValue, HandlesNestingOfAnyDepth) {
  Value arrays;
  Value same;
  Value dictionaries;
  for (int i = 0; i < 200000; ++i) {
    arrays = Array{std::move(arrays)};
    same = Array{std::move(same)};
    dictionaries = Dictionary{{"key", std::move(dictionaries)}};
  }
  EXPECT_TRUE(arrays == same);
  EXPECT_FALSE(arrays == dictionaries);
  const Value copy = dictionaries;
  EXPECT_TRUE(copy == dictionaries);
}

TEST(PropertyListDictionary, KeepsItsKeysInTheOrderOfTheirBytes) {
  Dictionary dictionary{{"b", 1}, {"", 2}, {"\xC3\xA9", 3}, {"B", 4}};
  dictionary.set("aa", 5);
  std::string keys;
  for (const auto& [key, value] : dictionary)
    keys += std::string(key) + ",";
  EXPECT_EQ(keys, ",B,aa,b,\xC3\xA9,");
}

TEST(PropertyListDictionary, LastOfEqualKeysWins) {
  const Dictionary dictionary{{"a", 1}, {"b", 2}, {"a", 3}};
  EXPECT_EQ(dictionary.size(), 2U);
  EXPECT_EQ(*dictionary.find("a"), Value(3));
}

TEST(PropertyListDictionary, SetsFindsAndErases) {
  Dictionary dictionary;
  EXPECT_TRUE(dictionary.empty());
  EXPECT_EQ(dictionary.begin(), dictionary.end());
  for (int i = 0; i < 1000; ++i)
    dictionary.set(std::to_string(i * 7919 % 1000), i);
  EXPECT_EQ(dictionary.size(), 1000U);
  for (int i = 0; i < 1000; i += 2)
    EXPECT_TRUE(dictionary.erase(std::to_string(i)));
  EXPECT_FALSE(dictionary.erase("0"));
  EXPECT_EQ(dictionary.size(), 500U);
  EXPECT_EQ(dictionary.find("0"), nullptr);
  EXPECT_TRUE(dictionary.contains("1"));
  *dictionary.find("1") = "changed";
  EXPECT_EQ(*std::as_const(dictionary).find("1"), Value("changed"));
}

TEST(PropertyListDictionary, EraseDoesNotChangeCopies) {
  Dictionary dictionary{{"a", 1}, {"b", 2}};
  const Dictionary copy = dictionary;
  EXPECT_TRUE(dictionary.erase("a"));
  dictionary.set("c", 3);
  EXPECT_EQ(copy, (Dictionary{{"a", 1}, {"b", 2}}));
  EXPECT_EQ(dictionary, (Dictionary{{"b", 2}, {"c", 3}}));
}

TEST(PropertyListDictionary, AcceptsKeyFromItsOwnContent) {
  Dictionary dictionary{{"a", "z"}, {"m", 1}};
  dictionary.set(*std::as_const(dictionary).find("a")->string(), 2);
  EXPECT_EQ(dictionary, (Dictionary{{"a", "z"}, {"m", 1}, {"z", 2}}));
}

TEST(PropertyListFind, ReturnsNullForNull) {
  const Value value = Dictionary{{"a", Dictionary{{"b", 1}}}};
  EXPECT_EQ(*plist::find(plist::find(&value, "a"), "b"), Value(1));
  EXPECT_EQ(plist::find(plist::find(&value, "x"), "b"), nullptr);
  EXPECT_EQ(plist::find(nullptr, "b"), nullptr);
}

TEST(PropertyListStringIn, ReturnsNulloptForOtherTypes) {
  const Value text("com.a");
  EXPECT_EQ(plist::stringIn(&text), "com.a");
  EXPECT_EQ(plist::ownedStringIn(&text), "com.a");
  EXPECT_EQ(plist::stringIn(nullptr), std::nullopt);
  EXPECT_EQ(plist::ownedStringIn(nullptr), std::nullopt);
  for (const Value& other : {Value(), Value(7), Value(Array{"com.a"})}) {
    EXPECT_EQ(plist::stringIn(&other), std::nullopt);
    EXPECT_EQ(plist::ownedStringIn(&other), std::nullopt);
  }
}

struct TruthCase {
  Value value;
  std::optional<bool> truth;
};

class PropertyListTruth : public testing::TestWithParam<TruthCase> {};

TEST_P(PropertyListTruth, ConvertsAsTabled) {
  EXPECT_EQ(plist::truth(GetParam().value), GetParam().truth);
}

INSTANTIATE_TEST_SUITE_P(Table, PropertyListTruth,
                         testing::Values(TruthCase{true, true}, TruthCase{false, false}, TruthCase{0, false},
                                         TruthCase{-3, true}, TruthCase{0.5, true}, TruthCase{0.0, false},
                                         TruthCase{UINT64_MAX, true}, TruthCase{"yes", true}, TruthCase{"YES", true},
                                         TruthCase{"true", true}, TruthCase{"T", true}, TruthCase{"no", false},
                                         TruthCase{"false", false}, TruthCase{"", false}, TruthCase{"1", true},
                                         TruthCase{"0", false}, TruthCase{"00010", true}, TruthCase{"-7x", true},
                                         TruthCase{" 2", true}, TruthCase{"x1", false},
                                         TruthCase{Array{}, std::nullopt}, TruthCase{Dictionary{}, std::nullopt},
                                         TruthCase{Value(), std::nullopt}, TruthCase{Value::data({}), std::nullopt},
                                         TruthCase{Date{1}, std::nullopt}, TruthCase{Uid{1}, std::nullopt}));

}  // namespace

}  // namespace appsync::test
