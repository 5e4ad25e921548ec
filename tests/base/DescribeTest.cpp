#include <cstdint>
#include <deque>
#include <filesystem>
#include <limits>
#include <map>
#include <memory>
#include <optional>
#include <set>
#include <span>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "base/Describe.h"
#include "base/Error.h"

namespace appsync::test {

/// Prints by a function of its own.
struct Version {
  int major = 0;
  int minor = 0;
};
void appendDescription(std::string& out, const Version& version) {
  out += std::to_string(version.major) + "." + std::to_string(version.minor);
}

/// Prints by its base's function.
struct Release : Version {};

/// Prints by a member, and is polymorphic.
struct Shape {
  virtual ~Shape() = default;
  virtual std::string description() const = 0;
};
struct Circle : Shape {
  std::string description() const override { return "<Circle>"; }
};

/// A function of its own counts more than a member or its elements.
struct Layout : std::vector<int> {
  std::string description() const { return "member"; }
};
void appendDescription(std::string& out, const Layout&) {
  out += "function";
}

/// Converts to something that prints, which is not enough.
struct NearlyVersion {
  operator Version() const { return {1, 2}; }
};
enum class Colour { red };
enum class Phase { loading };
void appendDescription(std::string& out, Phase) {
  out += "loading";
}

namespace {

TEST(Describe, PrintsTextUnchanged) {
  EXPECT_EQ(description("literal"), "literal");
  EXPECT_EQ(description(std::string("with\0zero", 9)), std::string("with\0zero", 9));
  EXPECT_EQ(description(std::string_view("view")), "view");
  const char* pointer = "pointer";
  EXPECT_EQ(description(pointer), "pointer");
  EXPECT_EQ(description(""), "");
}

TEST(Describe, PrintsNullCStringAsNull) {
  const char* none = nullptr;
  char* noneToChange = nullptr;
  EXPECT_EQ(description(none), "(null)");
  EXPECT_EQ(description(noneToChange), "(null)");
}

TEST(Describe, PrintsBooleansAsOneAndZero) {
  EXPECT_EQ(description(true), "1");
  EXPECT_EQ(description(false), "0");
}

TEST(Describe, PrintsCharactersUnchanged) {
  EXPECT_EQ(description('y'), "y");
}

TEST(Describe, IntegersPrintOverTheirWholeRange) {
  EXPECT_EQ(description(0), "0");
  EXPECT_EQ(description(std::numeric_limits<std::int64_t>::min()), "-9223372036854775808");
  EXPECT_EQ(description(std::numeric_limits<std::uint64_t>::max()), "18446744073709551615");
  EXPECT_EQ(description(std::int8_t{-5}), "-5");
  EXPECT_EQ(description(std::uint8_t{200}), "200");
}

TEST(Describe, PrintsShortestRealThatReadsBack) {
  EXPECT_EQ(description(0.1), "0.1");
  EXPECT_EQ(description(1.0), "1");
  EXPECT_EQ(description(-std::numeric_limits<double>::denorm_min()), "-5e-324");
  EXPECT_EQ(description(std::numeric_limits<double>::infinity()), "inf");
}

TEST(Describe, PrintsAbsenceAsNull) {
  EXPECT_EQ(description(nullptr), "(null)");
  EXPECT_EQ(description(std::nullopt), "(null)");
  EXPECT_EQ(description(std::optional<std::string>()), "(null)");
  EXPECT_EQ(description(std::unique_ptr<Shape>()), "(null)");
  EXPECT_EQ(description(std::shared_ptr<const Shape>()), "(null)");
  EXPECT_EQ(description(static_cast<const Version*>(nullptr)), "(null)");
}

TEST(Describe, PrintsTheValueOfAHandle) {
  EXPECT_EQ(description(std::optional<std::string>("text")), "text");
  EXPECT_EQ(description(std::optional<bool>(false)), "0");
  const Version version{2, 1};
  EXPECT_EQ(description(&version), "2.1");
  EXPECT_EQ(description(std::make_unique<Version>(version)), "2.1");
  EXPECT_EQ(description(std::shared_ptr<const Shape>(std::make_shared<Circle>())), "<Circle>");
}

TEST(Describe, HandlesMayBeNested) {
  EXPECT_EQ(description(std::optional<std::shared_ptr<int>>(std::make_shared<int>(3))), "3");
  EXPECT_EQ(description(std::optional<std::shared_ptr<int>>(nullptr)), "(null)");
}

TEST(Describe, FindsFunctionInTheNamespaceOfTheType) {
  EXPECT_EQ(description(Version{10, 3}), "10.3");
  EXPECT_EQ(description(Release{{4, 5}}), "4.5");
  EXPECT_EQ(description(Phase::loading), "loading");
  EXPECT_EQ(description(Error{"A", 1, "first", nullptr}), "A 1 \"first\"");
}

TEST(Describe, UsesMemberThroughTheBase) {
  const Circle circle;
  const Shape& shape = circle;
  EXPECT_EQ(description(shape), "<Circle>");
}

TEST(Describe, PrefersFunctionToMemberAndElements) {
  EXPECT_EQ(description(Layout{}), "function");
}

TEST(Describe, RangesPrintTheirElementsInParentheses) {
  EXPECT_EQ(description(std::vector<std::string>{"a", "b", "c"}), "(a, b, c)");
  EXPECT_EQ(description(std::set<std::string>{"b", "a"}), "(a, b)");
  const int numbers[] = {1, 2};
  EXPECT_EQ(description(std::span(numbers)), "(1, 2)");
  EXPECT_EQ(description(std::deque<Version>{{1, 0}}), "(1.0)");
  EXPECT_EQ(description(std::vector<bool>{true, false}), "(1, 0)");
}

TEST(Describe, AnEmptyRangeIsAPairOfParentheses) {
  EXPECT_EQ(description(std::vector<int>()), "()");
}

TEST(Describe, PrintsNestedRangesAndAbsentElements) {
  const std::vector<std::optional<std::vector<int>>> ranges{std::vector{1, 2}, std::nullopt};
  EXPECT_EQ(description(ranges), "((1, 2), (null))");
}

TEST(Describe, DescriptionsAreAppended) {
  std::string out = "set: ";
  describe(out, std::set<int>{1});
  EXPECT_EQ(out, "set: (1)");
}

static_assert(!Describable<Colour>, "an enumeration has no text unless it is given one");
static_assert(!Describable<NearlyVersion>, "a conversion is not a description");
static_assert(!Describable<void*>, "an address means nothing to people");
static_assert(!Describable<int (*)()>, "nor does that of a function");
static_assert(!Describable<wchar_t>, "wide text has no encoding here");
static_assert(!Describable<std::vector<Colour>>, "elements must be describable");
static_assert(!Describable<std::optional<Colour>>, "what an optional holds must be describable");
static_assert(!Describable<std::map<std::string, int>>, "a pair has no description");
static_assert(!Describable<std::filesystem::path>, "a range of its own type would never end");

}  // namespace
}  // namespace appsync::test
