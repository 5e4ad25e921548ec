#include <cmath>
#include <limits>

#include <gtest/gtest.h>

#include "cli/Json.h"

namespace appsync::cli {
namespace {

std::string json(const plist::Value& value) {
  return onOneLine(toJson(value));
}

plist::Value data(std::string_view text) {
  return plist::Value::data(bytesOf(text));
}

TEST(PropertyListJson, ConvertsScalars) {
  EXPECT_EQ(json(true), "true");
  EXPECT_EQ(json(-3), "-3");
  EXPECT_EQ(json(1.5), "1.5");
  EXPECT_EQ(json("text"), "\"text\"");
}

TEST(PropertyListJson, EscapesUnsafeCharacters) {
  EXPECT_EQ(json("\x7f \xc2\x9b[2J \xe2\x80\xae \xf3\xa0\x81\x81 é潮\n"),
            R"("\u007f \u009b[2J \u202e \udb40\udc41 é潮\n")");
  EXPECT_EQ(Json::parse(json("\xc2\x9b\xf3\xa0\x81\x81")), "\xc2\x9b\xf3\xa0\x81\x81");
  EXPECT_EQ(indented(Json::array({"\x7f"})), "[\n  \"\\u007f\"\n]");
}

TEST(PropertyListJson, KeepsIntegerRange) {
  EXPECT_EQ(json(std::numeric_limits<std::int64_t>::min()), "-9223372036854775808");
  EXPECT_EQ(json(std::numeric_limits<std::uint64_t>::max()), "18446744073709551615");
}

TEST(PropertyListJson, NonFiniteRealIsNull) {
  EXPECT_EQ(json(std::nan("")), "null");
  EXPECT_EQ(json(std::numeric_limits<double>::infinity()), "null");
}

TEST(PropertyListJson, DataIsBase64) {
  EXPECT_EQ(json(data("")), "\"\"");
  EXPECT_EQ(json(data("M")), "\"TQ==\"");
  EXPECT_EQ(json(data("Ma")), "\"TWE=\"");
  EXPECT_EQ(json(data("Man")), "\"TWFu\"");
  EXPECT_EQ(json(data("\xff\xfe\xfd")), "\"//79\"");
}

TEST(PropertyListJson, DatesAreISO8601) {
  EXPECT_EQ(json(plist::Date{0}), "\"2001-01-01T00:00:00Z\"");
  EXPECT_EQ(json(plist::Date{0.25}), "\"2001-01-01T00:00:00.250Z\"");
  EXPECT_EQ(json(plist::Date{-0.5}), "\"2000-12-31T23:59:59.500Z\"");
}

TEST(PropertyListJson, DateBeyondCalendarIsANumber) {
  EXPECT_EQ(json(plist::Date{1e15}), "1e+15");
}

TEST(PropertyListJson, UidIsAnObject) {
  EXPECT_EQ(json(plist::Uid{7}), R"({"CF$UID":7})");
}

TEST(PropertyListJson, ConvertsNestedContainers) {
  EXPECT_EQ(json(plist::Dictionary{{"b", plist::Array{1, "x"}}, {"a", plist::Dictionary()}}),
            R"({"a":{},"b":[1,"x"]})");
}

}  // namespace
}  // namespace appsync::cli
