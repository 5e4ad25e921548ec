#include <gtest/gtest.h>

#include "base/Message.h"
#include "tests/plist/Samples.h"

namespace appsync::test {

namespace {

using plist::Array;
using plist::Dictionary;
using plist::Failure;
using plist::Value;

using namespace std::string_literals;

std::string described(const Value& value) {
  std::string text;
  plist::appendDescription(text, value);
  return text;
}

TEST(PropertyListASCII, ReadsContainersStringsAndData) {
  const auto value =
      plist::read(bytesOf("// first\n{ a = b; \"c d\" = ( 1, 'x y', ); e = <0f A0\n1>; f = {}; g = () }"));
  EXPECT_EQ(outcome(value), "Data that is not a pair of digits at byte 52");
  const auto good = plist::read(bytesOf("/* c */ { a = b; \"c d\" = ( 1, 'x y', ); e = <0f A0\n11>; f = {}; g = () }"));
  ASSERT_TRUE(good.ok()) << outcome(good);
  EXPECT_EQ(*good, Value(Dictionary{{"a", "b"},
                                    {"c d", Array{"1", "x y"}},
                                    {"e", Value::data(bytesOf("\x0F\xA0\x11"))},
                                    {"f", Dictionary{}},
                                    {"g", Array{}}}));
}

TEST(PropertyListASCII, DecodesEscapes) {
  EXPECT_EQ(*plist::readText(bytesOf(R"("\"\\\n\t\101\U00e9\UD83D\UDE00\q")")), Value("\"\\\n\tAé😀q"));
  EXPECT_EQ(failureOf(plist::readText(bytesOf(R"("\UD83D x")"))), Failure::badText);
  EXPECT_EQ(failureOf(plist::readText(bytesOf(R"("\UDE00")"))), Failure::badText);
}

TEST(PropertyListASCII, ReadsAStringsFile) {
  EXPECT_EQ(*plist::read(bytesOf("/* Title */\n\"a b\" = \"c\";\nd = e;\nf;\n")),
            Value(Dictionary{{"a b", "c"}, {"d", "e"}, {"f", "f"}}));
}

TEST(PropertyListASCII, ReadsBareRoots) {
  EXPECT_EQ(*plist::read(bytesOf(" word ")), Value("word"));
  EXPECT_EQ(*plist::read(bytesOf("<00 ff>")), Value::data({Bytes{std::byte{0}, std::byte{0xFF}}}));
  EXPECT_EQ(*plist::read(bytesOf("<>")), Value::data({}));
  EXPECT_EQ(*plist::read(bytesOf("\xFF\xFE\"\0x\0\"\0"s)), Value("x"));
}

TEST(PropertyListASCII, RefusesOtherDocuments) {
  for (const char* text :
       {"",      " ",    "{",          "{a",   "{a =", "{a = b",         "{a = b;",   "(",   "(a", "(a b)",
        "<0",    "<0>",  "\"a",        "\"\\", "'",    "{a = b c = d;}", "two words", "/* ", "//", "}",
        "a = b", "{} x", "{(a) = b;}", "%",    "(,)"}) {
    EXPECT_FALSE(plist::readText(bytesOf(text)).ok()) << text;
  }
}

TEST(PropertyListASCII, RefusesTooDeepNesting) {
  EXPECT_TRUE(plist::read(bytesOf(std::string(512, '(') + std::string(512, ')'))).ok());
  EXPECT_EQ(failureOf(plist::read(bytesOf(std::string(513, '(') + std::string(513, ')')))), Failure::tooDeep);
  EXPECT_EQ(failureOf(plist::read(bytesOf(std::string(100000, '(')))), Failure::tooDeep);
}

TEST(PropertyListDescription, PrintsScalarsPlainly) {
  EXPECT_EQ(described(Value()), "(null)");
  EXPECT_EQ(described(true), "1");
  EXPECT_EQ(described(-5), "-5");
  EXPECT_EQ(described(UINT64_MAX), "18446744073709551615");
  EXPECT_EQ(described(0.5), "0.5");
  EXPECT_EQ(described("any text, \"quoted\""), "any text, \"quoted\"");
  EXPECT_EQ(described(plist::Date{0}), "2001-01-01T00:00:00Z");
  EXPECT_EQ(described(plist::Uid{7}), "uid 7");
}

TEST(PropertyListDescription, PrintsContainersOnOneLineInOrder) {
  EXPECT_EQ(described(Dictionary{{"b", Array{1, "x y", "z"}}, {"a", Dictionary{}}, {"c", Array{}}}),
            "{a = {}; b = (1, \"x y\", z); c = ();}");
}

TEST(PropertyListDescription, TakesOneLineInMessages) {
  EXPECT_EQ(formatMessage("%{public}@", Value("a\nb\r\x7F")), R"(a\nb\x0d\x7f)");
  EXPECT_EQ(formatMessage("%{public}@", Value(Array{"a\nb\"\\"})), R"(("a\nb\"\\"))");
}

TEST(PropertyListDescription, TruncatesLongDataAndDeepNesting) {
  EXPECT_EQ(described(Bytes(24, std::byte{0xAB})), "<abababababababababababababababababababababababab>");
  EXPECT_EQ(described(Bytes(25, std::byte{0xAB})), "<abababababababababababababababababababababababab… 25 bytes>");
  Value deep;
  for (int i = 0; i < 100000; ++i)
    deep = Array{std::move(deep)};
  EXPECT_EQ(described(deep), std::string(32, '(') + "…" + std::string(32, ')'));
}

TEST(PropertyListDescription, DescribesArraysLikeTheirValues) {
  for (const Array& array :
       {Array{}, Array{1, "two words", Array{"x"}, Dictionary{{"a", "b"}}}, Array(1'000'000, "text")}) {
    std::string text;
    plist::appendDescription(text, array);
    EXPECT_EQ(text, described(array));
  }
}

TEST(PropertyListDescription, TruncatesExpandedSharedContent) {
  Value value = "text";
  for (int i = 0; i < 60; ++i)
    value = Array{value, value};
  EXPECT_LT(described(value).size(), 2000000U);
}

}  // namespace

}  // namespace appsync::test
