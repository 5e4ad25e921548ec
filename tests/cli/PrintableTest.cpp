#include <clocale>

#include <gtest/gtest.h>

#include "cli/Printable.h"

namespace appsync::cli {
namespace {

class Printable : public testing::Test {
 protected:
  static void SetUpTestSuite() { std::setlocale(LC_CTYPE, "C.UTF-8"); }
};

TEST_F(Printable, KeepsOrdinaryText) {
  EXPECT_EQ(printable("Tides 1.0"), "Tides 1.0");
}

TEST_F(Printable, KeepsTextInAnyScript) {
  EXPECT_EQ(printable("Gezeiten für Köln, 潮汐, Приливы"), "Gezeiten für Köln, 潮汐, Приливы");
}

TEST_F(Printable, EscapesTerminalSequences) {
  EXPECT_EQ(printable("\x1b[2JHa"), "\\x1b[2JHa");
}

TEST_F(Printable, EscapesLineEndsTabsAndNulBytes) {
  EXPECT_EQ(printable(std::string_view("a\nb\tc\0d\x7f", 8)), "a\\x0ab\\x09c\\x00d\\x7f");
}

TEST_F(Printable, EscapesControlCharactersAboveASCII) {
  EXPECT_EQ(printable("\xc2\x9b"
                      "31m"),
            "\\u{9b}31m");
}

TEST_F(Printable, EscapesChangesOfWritingDirection) {
  EXPECT_EQ(printable("exe\xe2\x80\xae"
                      "fdp"),
            "exe\\u{202e}fdp");
}

TEST_F(Printable, EscapesInvalidUTF8) {
  EXPECT_EQ(printable("\xff\xc3"), "\\xff\\xc3");
}

TEST_F(Printable, EscapesOverlongAndSurrogateEncodings) {
  EXPECT_EQ(printable("\xc0\xaf"), "\\xc0\\xaf");
  EXPECT_EQ(printable("\xed\xa0\x80"), "\\xed\\xa0\\x80");
  EXPECT_EQ(printable("\xf4\x90\x80\x80"), "\\xf4\\x90\\x80\\x80");
}

TEST_F(Printable, CutsLongText) {
  EXPECT_EQ(printable("abcdefgh", 8), "abcdefgh");
  EXPECT_EQ(printable("abcdefghi", 8), "abcde...");
}

TEST_F(Printable, NeverSplitsACharacter) {
  EXPECT_EQ(printable("潮汐潮汐", 6), "潮...");
}

TEST_F(Printable, WidthCountsColumnsNotBytes) {
  EXPECT_EQ(displayWidth("潮汐"), 4U);
  EXPECT_EQ(displayWidth("Köln"), 4U);
}

TEST_F(Printable, FittedTextHasTheExactWidth) {
  EXPECT_EQ(fitted("ab", 4), "ab  ");
  EXPECT_EQ(fitted("abcdef", 4), "a...");
  EXPECT_EQ(displayWidth(fitted("潮汐潮汐", 6)), 6U);
  EXPECT_EQ(fitted("abcdef", 0), "");
}

TEST_F(Printable, FormatsByteCounts) {
  EXPECT_EQ(byteCount(0), "0 bytes");
  EXPECT_EQ(byteCount(999), "999 bytes");
  EXPECT_EQ(byteCount(1000), "1.0 kB");
  EXPECT_EQ(byteCount(999'949), "999.9 kB");
  EXPECT_EQ(byteCount(999'950), "1.0 MB");
  EXPECT_EQ(byteCount(1'234'567'890), "1.2 GB");
}

TEST_F(Printable, DetectsUTF8) {
  EXPECT_TRUE(isUTF8(""));
  EXPECT_TRUE(isUTF8("größer"));
  EXPECT_FALSE(isUTF8("gr\xf6sser"));
}

}  // namespace
}  // namespace appsync::cli
