#include <cmath>

#include <gtest/gtest.h>

#include "tests/plist/Samples.h"

namespace appsync::test {

namespace {

using plist::Array;
using plist::Date;
using plist::Dictionary;
using plist::Failure;
using plist::Value;

using namespace std::string_literals;

Result<Value> readElement(std::string_view element) {
  return plist::readXML(bytesOf("<plist version=\"1.0\">" + std::string(element) + "</plist>"));
}

TEST(PropertyListXML, ReadsWrittenDocuments) {
  const auto document = plist::writeXML(sampleValue());
  ASSERT_TRUE(document.ok());
  const auto value = plist::readXML(*document);
  ASSERT_TRUE(value.ok()) << outcome(value);
  EXPECT_EQ(*value, sampleValue());
}

TEST(PropertyListXML, WritesKnownText) {
  const auto document =
      plist::writeXML(Dictionary{{"a&b", Array{true, -1, 0.5, "<x>"}}, {"d", Bytes(58, std::byte{0})}, {"e", Array{}}});
  EXPECT_EQ(textOf(document), R"(<?xml version="1.0" encoding="UTF-8"?>
<plist version="1.0">
<dict>
	<key>a&amp;b</key>
	<array>
		<true/>
		<integer>-1</integer>
		<real>0.5</real>
		<string>&lt;x&gt;</string>
	</array>
	<key>d</key>
	<data>
	AAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAAA
	AA==
	</data>
	<key>e</key>
	<array/>
</dict>
</plist>
)");
}

TEST(PropertyListXML, RefusesValuesThatXMLCannotRepresent) {
  for (const Value& value : {Value(), Value(Array{Value()}), Value(plist::Uid{1}), Value("\x01"), Value("\xFF"),
                             Value("\xEF\xBF\xBF"), Value(Date{1e300}), Value(Dictionary{{"\x02", 1}})}) {
    EXPECT_FALSE(plist::writeXML(value).ok());
  }
}

TEST(PropertyListXML, KeepsCarriageReturnsDropsFractionsOfSeconds) {
  EXPECT_EQ(*plist::readXML(*plist::writeXML(Value("a\r\nb\r"))), Value("a\r\nb\r"));
  EXPECT_EQ(*plist::readXML(*plist::writeXML(Value(Date{1.75}))), Value(Date{1}));
  EXPECT_EQ(*plist::readXML(*plist::writeXML(Value(Date{-0.25}))), Value(Date{-1}));
}

TEST(PropertyListXML, ReadsIntegersDecimalAndHexadecimal) {
  EXPECT_EQ(*readElement("<integer>-9223372036854775808</integer>"), Value(INT64_MIN));
  EXPECT_EQ(*readElement("<integer>18446744073709551615</integer>"), Value(UINT64_MAX));
  EXPECT_EQ(*readElement("<integer> +7\n</integer>"), Value(7));
  EXPECT_EQ(*readElement("<integer>0xFFffFFffFFffFFff</integer>"), Value(UINT64_MAX));
  EXPECT_EQ(*readElement("<integer>-0x10</integer>"), Value(-16));
}

TEST(PropertyListXML, RefusesInvalidAndTooLargeIntegers) {
  EXPECT_EQ(failureOf(readElement("<integer>18446744073709551616</integer>")), Failure::outOfRange);
  EXPECT_EQ(failureOf(readElement("<integer>-9223372036854775809</integer>")), Failure::outOfRange);
  for (const char* text : {"", "1.5", "0x", "--1", "1 2", "x"}) {
    EXPECT_EQ(failureOf(readElement("<integer>" + std::string(text) + "</integer>")), Failure::malformed) << text;
  }
}

TEST(PropertyListXML, ReadsReals) {
  EXPECT_EQ(*readElement("<real>1e+16</real>"), Value(1e16));
  EXPECT_EQ(*readElement("<real>-inf</real>"), Value(-INFINITY));
  EXPECT_EQ(*readElement("<real>nan</real>"), Value(NAN));
  EXPECT_EQ(*readElement("<real>+infinity</real>"), Value(INFINITY));
  EXPECT_EQ(*readElement("<real>1e-999</real>"), Value(0.0));
  EXPECT_EQ(*readElement("<real>5e-324</real>"), Value(5e-324));
  EXPECT_EQ(failureOf(readElement("<real>1e999</real>")), Failure::outOfRange);
  for (const char* text : {"", "nan(1)", "1.5x", "+-1", "0x10"}) {
    EXPECT_EQ(failureOf(readElement("<real>" + std::string(text) + "</real>")), Failure::malformed) << text;
  }
}

TEST(PropertyListXML, RefusesDatesOutsideTheCalendar) {
  EXPECT_EQ(*readElement("<date>2001-01-01T00:00:00Z</date>"), Value(Date{0}));
  EXPECT_EQ(*readElement("<date>2000-02-29T23:59:59Z</date>"), Value(Date{-26438401}));
  EXPECT_EQ(*readElement("<date>0001-01-01T00:00:00Z</date>"), Value(Date{-63113904000}));
  EXPECT_EQ(*readElement("<date>9999-12-31T23:59:59Z</date>"), Value(Date{252423993599}));
  for (const char* text :
       {"2001-02-29T00:00:00Z", "0000-01-01T00:00:00Z", "2001-13-01T00:00:00Z", "2001-00-01T00:00:00Z",
        "2001-01-01T24:00:00Z", "2001-01-01T00:60:00Z", "2001-01-01T00:00:60Z", "2001-01-01", "", "x"}) {
    EXPECT_EQ(failureOf(readElement("<date>" + std::string(text) + "</date>")), Failure::outOfRange) << text;
  }
}

TEST(PropertyListXML, IgnoresWhiteSpaceInData) {
  EXPECT_EQ(*readElement("<data>\n\tYW\r\nJ j\n</data>"), Value::data(bytesOf("abc")));
  EXPECT_EQ(*readElement("<data>YQ==</data>"), Value::data(bytesOf("a")));
  EXPECT_EQ(*readElement("<data>YWI=\n</data>"), Value::data(bytesOf("ab")));
  EXPECT_EQ(*readElement("<data/>"), Value::data({}));
  EXPECT_EQ(*readElement("<data>YW<!-- -->Jj&#10;</data>"), Value::data(bytesOf("abc")));
  for (const char* text : {"YQ=", "YQ", "Y", "Y===", "YQ==YQ==", "Y?==", "=", "YWJj="}) {
    EXPECT_EQ(failureOf(readElement("<data>" + std::string(text) + "</data>")), Failure::malformed) << text;
  }
}

TEST(PropertyListXML, DecodesReferences) {
  EXPECT_EQ(*readElement("<string>&lt;&gt;&amp;&quot;&apos;</string>"), Value("<>&\"'"));
  EXPECT_EQ(*readElement("<string>&#65;&#x42;&#x1F600;&#13;</string>"), Value("AB😀\r"));
  EXPECT_EQ(*readElement("<dict><key>&amp;</key><true/></dict>"), Value(Dictionary{{"&", true}}));
}

TEST(PropertyListXML, RefusesInvalidReferences) {
  for (const char* text : {"&#0;", "&#xD800;", "&#xDFFF;", "&#x1;", "&#xFFFE;", "&#x110000;", "&#99999999999;"}) {
    EXPECT_EQ(failureOf(readElement("<string>" + std::string(text) + "</string>")), Failure::badText) << text;
  }
  for (const char* text : {"&nbsp;", "&;", "&#;", "&#x;", "&#12a;", "& ", "&amp"}) {
    EXPECT_EQ(failureOf(readElement("<string>" + std::string(text) + "</string>")), Failure::malformed) << text;
  }
}

TEST(PropertyListXML, ReadsSectionsAndCommentsWithinText) {
  EXPECT_EQ(*readElement("<string>a<![CDATA[<&]]]>b<!-- no -->c<?no?>d</string>"), Value("a<&]bcd"));
  EXPECT_EQ(*readElement("<!-- --><?x?><true/><!---->"), Value(true));
}

TEST(PropertyListXML, NormalisesLineEnds) {
  EXPECT_EQ(*readElement("<string>a\r\nb\rc\n<![CDATA[\r\n\r]]></string>"), Value("a\nb\nc\n\n\n"));
}

TEST(PropertyListXML, RefusesCharactersThatXMLForbids) {
  EXPECT_EQ(failureOf(readElement("<string>\x01</string>")), Failure::badText);
  EXPECT_EQ(failureOf(readElement("<string>\0</string>"s)), Failure::badText);
  EXPECT_EQ(failureOf(readElement("<string>\xEF\xBF\xBE</string>")), Failure::badText);
  EXPECT_EQ(*readElement("<string>\xEF\xBF\xBD\xEF\xBC\x8C</string>"), Value("\xEF\xBF\xBD\xEF\xBC\x8C"));
}

TEST(PropertyListXML, RefusesMalformedUTF8AndNamesItsByte) {
  EXPECT_EQ(outcome(plist::readXML(bytesOf("<string>\xC3(</string>"))), "A byte that is not UTF-8 at byte 8");
  for (const char* text :
       {"\xFF", "\xC0\x80", "\xE0\x80\x80", "\xED\xA0\x80", "\xF4\x90\x80\x80", "\xF0\x8F\xBF\xBF", "\x80"}) {
    EXPECT_EQ(failureOf(readElement("<string>" + std::string(40, 'x') + text + "</string>")), Failure::badText);
  }
}

std::string asUTF16(std::string_view ascii, bool isBig) {
  std::string out;
  for (const char c : ascii)
    out += isBig ? std::string{'\0', c} : std::string{c, '\0'};
  return out;
}

TEST(PropertyListXML, ReadsUTF16WithAndWithoutByteOrderMark) {
  const std::string_view text = "<?xml version=\"1.0\" encoding=\"UTF-16\"?><string>x</string>";
  EXPECT_EQ(*plist::read(bytesOf("\xFE\xFF" + asUTF16(text, true))), Value("x"));
  EXPECT_EQ(*plist::read(bytesOf("\xFF\xFE" + asUTF16(text, false))), Value("x"));
  EXPECT_EQ(*plist::read(bytesOf(asUTF16(text, true))), Value("x"));
  EXPECT_EQ(*plist::read(bytesOf(asUTF16(text, false))), Value("x"));
  EXPECT_EQ(failureOf(plist::read(bytesOf("\xFE\xFF" + asUTF16(text, true) + "\xD8"))), Failure::badText);
  EXPECT_EQ(failureOf(plist::read(bytesOf("\xFE\xFF" + asUTF16("<string>", true) + "\xD8\x01\x00x"s))),
            Failure::badText);
}

TEST(PropertyListXML, SkipsByteOrderMarkRefusesOtherEncodings) {
  EXPECT_EQ(*plist::read(bytesOf("\xEF\xBB\xBF<true/>")), Value(true));
  EXPECT_EQ(*plist::read(bytesOf("<?xml version='1.0' encoding='utf-8'?><true/>")), Value(true));
  EXPECT_EQ(failureOf(plist::read(bytesOf("<?xml version='1.0' encoding='latin-1'?><true/>"))), Failure::unsupported);
}

TEST(PropertyListXML, SkipsADocumentTypeWithoutEntities) {
  EXPECT_EQ(*plist::read(bytesOf("<!DOCTYPE plist PUBLIC \"-//a>b\" \"http://x/\"><plist><true/></plist>")),
            Value(true));
  EXPECT_EQ(*plist::read(bytesOf("<!DOCTYPE plist [<!ELEMENT a (b)> <!-- ]> --> <?x ]>?> <!ATTLIST a b CDATA \"]>\">]>"
                                 "<true/>")),
            Value(true));
}

TEST(PropertyListXML, RefusesEntityDeclarations) {
  EXPECT_EQ(failureOf(plist::read(bytesOf("<!DOCTYPE x [<!ENTITY a \"b\">]><string>&a;</string>"))),
            Failure::unsupported);
  EXPECT_EQ(failureOf(plist::read(bytesOf("<!DOCTYPE x [<!ENTITY % a \"b\">]><true/>"))), Failure::unsupported);
}

TEST(PropertyListXML, AcceptsAttributesAndSpaceInTags) {
  EXPECT_EQ(*plist::read(bytesOf("<plist a='>' >\n<string\tb=\"/>\">x</string >\n</plist\n>")), Value("x"));
  EXPECT_EQ(*readElement("<true ></true>"), Value(true));
  EXPECT_FALSE(readElement("<array><true/><false / ></array>").ok());
}

TEST(PropertyListXML, LastOfEqualKeysWins) {
  const std::string twice = "<dict><key>a</key><true/><key>b</key><true/><key>a</key><false/></dict>";
  const Value once = Dictionary{{"a", false}, {"b", true}};
  EXPECT_EQ(*readElement(twice), once);
  EXPECT_EQ(*readElement("<array>" + twice + twice + "</array>"), Value(Array{once, once}));
}

TEST(PropertyListXML, ReadsDictionariesOfSameAndOtherKeys) {
  const auto value = readElement(
      "<array><dict><key>b</key><true/><key>a</key><false/></dict><dict><key>b</key><false/><key>a</key><true/></dict>"
      "<dict><key>b</key><true/></dict><dict/><dict><key>b</key><true/><key>c</key><false/><key>a</key><true/></dict>"
      "</array>");
  ASSERT_TRUE(value.ok()) << outcome(value);
  EXPECT_EQ(*value,
            Value(Array{Dictionary{{"a", false}, {"b", true}}, Dictionary{{"a", true}, {"b", false}},
                        Dictionary{{"b", true}}, Dictionary{}, Dictionary{{"a", true}, {"b", true}, {"c", false}}}));
}

TEST(PropertyListXML, RefusesOtherDocuments) {
  for (const char* text : {"",
                           "<plist/>",
                           "<plist></plist>",
                           "<plist><true/><true/></plist>",
                           "<true/>x",
                           "x<true/>",
                           "<key>a</key>",
                           "<unknown/>",
                           "<dict><true/></dict>",
                           "<dict><key>a</key></dict>",
                           "<dict><key>a</key><key>b</key></dict>",
                           "<array>x</array>",
                           "<string><b>x</b></string>",
                           "<string>x</integer>",
                           "<array></dict>",
                           "</array>",
                           "<true>x</true>",
                           "<integer/>",
                           "<array><key>a</key></array>",
                           "<plist><true/>",
                           "<string",
                           "<string>x",
                           "<!-- ",
                           "<?x",
                           "<string>x<![CDATA[",
                           "<a b=\"",
                           "<true/><true/>",
                           "<true</true>"}) {
    EXPECT_FALSE(plist::readXML(bytesOf(text)).ok()) << text;
  }
}

TEST(PropertyListXML, RefusesTooDeepNesting) {
  const auto nested = [](int depth) {
    std::string text;
    for (int i = 0; i < depth; ++i)
      text += i % 2 == 0 ? "<array>" : "<dict><key>k</key>";
    text += "<true/>";
    for (int i = depth; i-- > 0;)
      text += i % 2 == 0 ? "</array>" : "</dict>";
    return text;
  };
  const auto value = plist::readXML(bytesOf(nested(plist::kMaximumDepth)));
  ASSERT_TRUE(value.ok()) << outcome(value);
  EXPECT_TRUE(plist::writeXML(*value).ok());
  EXPECT_EQ(failureOf(plist::readXML(bytesOf(nested(plist::kMaximumDepth + 1)))), Failure::tooDeep);
  EXPECT_EQ(failureOf(plist::readXML(bytesOf(nested(100000)))), Failure::tooDeep);
  EXPECT_FALSE(plist::writeXML(Array{*value}).ok());
}

}  // namespace

}  // namespace appsync::test
