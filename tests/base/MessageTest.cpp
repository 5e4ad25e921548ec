#include <algorithm>
#include <clocale>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <type_traits>
#include <vector>

#include <gtest/gtest.h>

#include "base/Error.h"
#include "base/Message.h"

namespace appsync::test {
namespace {

TEST(Message, PrintsFormatWithoutConversions) {
  EXPECT_EQ(formatMessage("todo list is not an array"), "todo list is not an array");
  EXPECT_EQ(formatMessage(""), "");
}

TEST(Message, KeepsTheTextAroundAndBetweenConversions) {
  EXPECT_EQ(formatMessage("%s|Changing %{public}@ from %{public}@ to %{public}@", "com.a", "b", "SENT", "FAILED"),
            "com.a|Changing b from SENT to FAILED");
  EXPECT_EQ(formatMessage("%d%d", 1, 2), "12");
  EXPECT_EQ(formatMessage("%s", "x"), "x");
}

TEST(Message, TextMayBeOfAnyKind) {
  const std::string text = "string";
  const char* none = nullptr;
  EXPECT_EQ(formatMessage("%s %s %s %s", text, std::string_view("view"), "literal", none),
            "string view literal (null)");
}

TEST(Message, PercentSignsInArgumentsAreNotConversions) {
  EXPECT_EQ(formatMessage("%s|", "100%d"), "100%d|");
}

TEST(Message, SignedIntegersPrintOverTheirWholeRange) {
  EXPECT_EQ(formatMessage("%d %d", std::numeric_limits<int>::min(), std::numeric_limits<int>::max()),
            "-2147483648 2147483647");
  EXPECT_EQ(formatMessage("%ld", std::numeric_limits<long>::min()), "-9223372036854775808");
  EXPECT_EQ(formatMessage("%lld", std::numeric_limits<long long>::max()), "9223372036854775807");
}

TEST(Message, UnsignedIntegersPrintOverTheirWholeRange) {
  EXPECT_EQ(formatMessage("%u", std::numeric_limits<unsigned>::max()), "4294967295");
  EXPECT_EQ(formatMessage("%lu", std::numeric_limits<std::size_t>::max()), "18446744073709551615");
  EXPECT_EQ(formatMessage("%llu", std::numeric_limits<std::uint64_t>::max()), "18446744073709551615");
}

TEST(Message, NarrowerIntegersFitWiderConversions) {
  EXPECT_EQ(formatMessage("%d %lld %lu", std::int8_t{-1}, 7, std::uint8_t{255}), "-1 7 255");
}

TEST(Message, PrintsBooleansAsNumbersOrLetters) {
  EXPECT_EQ(formatMessage("(found=%d pi=%d) isRestore=%c %c", true, false, true, false),
            "(found=1 pi=0) isRestore=y n");
}

TEST(Message, PrintsCharactersUnchanged) {
  EXPECT_EQ(formatMessage("%c%c", 'y', '%'), "y%");
}

TEST(Message, RealsHaveSixDigitsAfterThePoint) {
  EXPECT_EQ(formatMessage("%f %lf %f", 0.5, 1.0 / 3, 2.5F), "0.500000 0.333333 2.500000");
  EXPECT_EQ(formatMessage("%f", -0.0000001), "-0.000000");
}

TEST(Message, TheLongestRealsPrintWhole) {
  const std::string lowest = formatMessage("%f", std::numeric_limits<double>::lowest());
  EXPECT_EQ(lowest.size(), std::string_view("-.000000").size() + std::numeric_limits<double>::max_exponent10 + 1);
  EXPECT_TRUE(lowest.starts_with("-17976931348623157") && lowest.ends_with(".000000")) << lowest;
  EXPECT_EQ(formatMessage("%f", std::numeric_limits<double>::infinity()), "inf");
}

TEST(Message, DoesNotDependOnTheLocale) {
  const std::string before = std::setlocale(LC_ALL, nullptr);
  std::setlocale(LC_ALL, "de_DE.UTF-8");
  EXPECT_EQ(formatMessage("%f %{public}@ %d", 1234.5, 0.5, 1234567), "1234.500000 0.5 1234567");
  std::setlocale(LC_ALL, before.c_str());
}

TEST(Message, TwoPercentSignsPrintOne) {
  EXPECT_EQ(formatMessage("%d%% of %%s", 50), "50% of %s");
}

TEST(Message, ObjectConversionPrintsAnyDescribable) {
  const std::optional<Error> error = Error{"ZTError", 29, "given up", nullptr};
  const std::unique_ptr<std::string> none;
  EXPECT_EQ(formatMessage("[%{public}@] [%{public}@] [%{public}@]", std::vector{1, 2}, error, none),
            "[(1, 2)] [ZTError 29 \"given up\"] [(null)]");
}

TEST(Message, ObjectConversionNeedsNoPublic) {
  EXPECT_EQ(formatMessage("%s/%@.png", "/Icons", std::string("com.a")), "/Icons/com.a.png");
}

TEST(Message, IsAppended) {
  std::string out = "10:00 ";
  appendMessage(out, "%s|%d", "a", 1);
  EXPECT_EQ(out, "10:00 a|1");
}

TEST(Message, ArgumentsAreNotCopied) {
  struct Uncopyable {
    Uncopyable() = default;
    Uncopyable(const Uncopyable&) = delete;
    std::string description() const { return "one"; }
  };
  EXPECT_EQ(formatMessage("%{public}@", Uncopyable()), "one");
}

TEST(Message, EscapesControlCharactersInArguments) {
  EXPECT_EQ(formatMessage("%s", std::string_view("a\nb\r\tc\x7f\0e", 9)), R"(a\nb\x0d\x09c\x7f\x00e)");
  EXPECT_EQ(formatMessage("%c %{public}@", '\n', std::vector<std::string>{"a\nb", "c"}), R"(\n (a\nb, c))");
  EXPECT_EQ(formatMessage("%{public}@", std::optional<Error>(Error{"a\n", 1, "b\n", nullptr})), R"(a\n 1 "b\n")");
}

TEST(Message, EscapesEachByteAtEachPlace) {
  for (std::size_t place = 0; place < 20; ++place) {
    for (int byte = 0; byte < 0x100; ++byte) {
      std::string text(20, 'x');
      text[place] = static_cast<char>(byte);
      const bool isPrintable = byte >= 0x20 && byte < 0x7F;
      EXPECT_EQ(formatMessage("%s", text) == text, isPrintable) << byte << " at " << place;
    }
  }
}

TEST(Message, EscapesC1BidirectionalAndSeparators) {
  EXPECT_EQ(formatMessage("%s", "\xc2\x9b[2J \xe2\x80\xae \xe2\x80\xa8 \xe2\x81\xa6"),
            R"(\xc2\x9b[2J \xe2\x80\xae \xe2\x80\xa8 \xe2\x81\xa6)");
}

TEST(Message, EscapesBytesThatAreNotUTF8) {
  EXPECT_EQ(formatMessage("%s|%s", "\x9b", "\xe6\xbd"), R"(\x9b|\xe6\xbd)");
}

TEST(Message, KeepsPrintableTextAndItsFormat) {
  EXPECT_EQ(formatMessage("…%s", "\xc3\xa9 \xe6\xbd\xae \\n \"x\""), "…\xc3\xa9 \xe6\xbd\xae \\n \"x\"");
}

/// A format as a template argument: whether it suits its arguments becomes a question instead of an error.
template <std::size_t size>
struct Literal {
  consteval Literal(const char (&text)[size]) { std::copy_n(text, size, characters); }
  char characters[size] = {};
};
template <Literal format, class... Args>
concept Compiles = requires {
  typename std::bool_constant<(MessageFormat<Args...>(format.characters), true)>;
};

enum class Colour { red };
enum Plain { kPlain };

static_assert(Compiles<"%s|%{public}@ %d %lu %c %lf %%", const char*, std::string, int, unsigned long, char, double>);
static_assert(Compiles<"">);

// The number of arguments.
static_assert(!Compiles<"%s">);
static_assert(!Compiles<"%s %s", const char*>);
static_assert(!Compiles<"", int>);
static_assert(!Compiles<"%d", int, int>);
static_assert(!Compiles<"%%", int>);

// Unknown conversions.
static_assert(!Compiles<"%x", int>);
static_assert(!Compiles<"%i", int>);
static_assert(!Compiles<"%5d", int>);
static_assert(!Compiles<"%.2f", double>);
static_assert(!Compiles<"%lls", const char*>);
static_assert(!Compiles<"%llld", long long>);
static_assert(!Compiles<"%{private}@", const char*>);
static_assert(!Compiles<"%{public}s", const char*>);
static_assert(!Compiles<"%{public}", const char*>);
static_assert(!Compiles<"%">);
static_assert(!Compiles<"100%", int>);
static_assert(!Compiles<"%l", int>);

// Text.
static_assert(Compiles<"%s", char[4]> && Compiles<"%s", std::string_view> && Compiles<"%s", char*>);
static_assert(!Compiles<"%s", int> && !Compiles<"%s", std::nullptr_t> && !Compiles<"%s", char>);
static_assert(!Compiles<"%s", std::optional<std::string>>);

// Signed integers.
static_assert(Compiles<"%d", bool> && Compiles<"%d", short> && Compiles<"%ld", int> && Compiles<"%lld", std::int64_t>);
static_assert(!Compiles<"%d", long> && !Compiles<"%d", std::int64_t>);
static_assert(!Compiles<"%d", unsigned> && !Compiles<"%lld", std::uint64_t> && !Compiles<"%lld", std::uint32_t>);
static_assert(!Compiles<"%d", char> && !Compiles<"%d", double> && !Compiles<"%d", Colour> && !Compiles<"%d", Plain>);

// Unsigned integers.
static_assert(Compiles<"%u", std::uint16_t> && Compiles<"%lu", std::size_t> && Compiles<"%llu", std::uint64_t>);
static_assert(!Compiles<"%u", unsigned long> && !Compiles<"%u", int> && !Compiles<"%lu", long>);
static_assert(!Compiles<"%lu", bool> && !Compiles<"%lu", Colour> && !Compiles<"%llu", char8_t>);

// Reals, characters, objects.
static_assert(Compiles<"%f", float> && Compiles<"%lf", double>);
static_assert(!Compiles<"%f", int> && !Compiles<"%f", long double> && !Compiles<"%f", const char*>);
static_assert(Compiles<"%c", char> && Compiles<"%c", bool>);
static_assert(!Compiles<"%c", int> && !Compiles<"%c", const char*>);
static_assert(Compiles<"%{public}@", std::optional<Error>> && Compiles<"%{public}@", std::nullptr_t>);
static_assert(!Compiles<"%{public}@", Colour> && !Compiles<"%{public}@", void*>);

}  // namespace
}  // namespace appsync::test
