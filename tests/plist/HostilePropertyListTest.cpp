// Damaged and malicious documents.
#include <gtest/gtest.h>

#include "tests/plist/Samples.h"

namespace appsync::test {

namespace {

using plist::Array;
using plist::Dictionary;
using plist::Failure;
using plist::Value;

/// A copy of exactly that size: a sanitizer sees every byte read past its end.
Result<Value> readExactly(std::string_view text) {
  const std::vector<char> copy(text.begin(), text.end());
  return plist::read(std::as_bytes(std::span(copy)));
}

/// Whatever was read can be written and read back.
void expectSound(const Result<Value>& value) {
  if (!value) {
    EXPECT_NE(value.error().text.find(" at byte "), std::string::npos) << value.error().text;
    return;
  }
  const auto written = plist::writeBinary(*value);
  ASSERT_TRUE(written.ok()) << written.error().text;
  const auto back = plist::readBinary(*written);
  ASSERT_TRUE(back.ok()) << outcome(back);
  EXPECT_EQ(*back, *value);
}

std::vector<std::string> documents() {
  return {std::string(textOf(plist::writeBinary(sampleValue()))), std::string(textOf(plist::writeXML(sampleValue()))),
          "{ a = \"b\\U00e9\"; c = (1, <0f a0>, { d = e; }); /* f */ }"};
}

TEST(PropertyListHostile, ReadsDocumentsTruncatedAtEveryByte) {
  for (const std::string& document : documents()) {
    const std::size_t complete = document.find_last_not_of('\n') + 1;
    for (std::size_t size = 0; size < complete; ++size) {
      const auto value = readExactly(document.substr(0, size));
      // The beginning of "bplist00" is a word of the old text form.
      const bool isWord = document.starts_with("bplist") && size > 0 && size < 6;
      EXPECT_EQ(value.ok(), isWord) << size;
      expectSound(value);
    }
  }
}

TEST(PropertyListHostile, ReadsDocumentsWithEachBitFlipped) {
  for (std::string document : documents()) {
    for (std::size_t bit = 0; bit < document.size() * 8; ++bit) {
      const auto flip = static_cast<char>(1U << bit % 8);
      document[bit / 8] = static_cast<char>(document[bit / 8] ^ flip);
      expectSound(readExactly(document));
      document[bit / 8] = static_cast<char>(document[bit / 8] ^ flip);
    }
  }
}

TEST(PropertyListHostile, ReadsExtremeTrailers) {
  const std::string document = documents().front();
  for (std::size_t at = document.size() - 32; at < document.size(); ++at) {
    for (const char byte : {'\0', '\x7F', '\x80', '\xFF'}) {
      std::string changed = document;
      changed[at] = byte;
      expectSound(readExactly(changed));
    }
  }
}

TEST(PropertyListHostile, RefusesLengthsBeyondTheDocument) {
  for (const char* marker : {"\x4F", "\x5F", "\x6F", "\xAF", "\xDF"}) {
    for (const char fill : {'\x7F', '\xFF'}) {
      const std::string object = marker + std::string("\x13") + std::string(8, fill);
      EXPECT_EQ(failureOf(readExactly(binaryDocument({object}))), Failure::outOfRange);
    }
    EXPECT_EQ(failureOf(readExactly(binaryDocument({marker + std::string("\x14") + std::string(16, '\0')}))),
              Failure::malformed);
    EXPECT_EQ(failureOf(readExactly(binaryDocument({marker + std::string("\x51")}))), Failure::malformed);
  }
}

TEST(PropertyListHostile, RefusesContainerThatContainsItself) {
  EXPECT_EQ(failureOf(readExactly(binaryDocument({std::string("\xA1\0", 2)}))), Failure::tooDeep);
  EXPECT_EQ(failureOf(readExactly(binaryDocument({std::string("\xA3\0\0\0", 4)}))), Failure::tooDeep);
  EXPECT_EQ(failureOf(readExactly(binaryDocument({std::string("\xD1\x01\0", 3), "\x51k"}))), Failure::tooDeep);
  EXPECT_EQ(failureOf(readExactly(binaryDocument({std::string("\xA2\x01\x01"), std::string("\xA2\0\0", 3)}))),
            Failure::tooDeep);
}

TEST(PropertyListHostile, RefusesKeyThatContainsItsDictionary) {
  EXPECT_FALSE(readExactly(binaryDocument({std::string("\xD1\0\x01", 3), "\x51k"})).ok());
}

TEST(PropertyListHostile, RefusesExpansionToTooManyValues) {
  std::vector<std::string> objects;
  for (char i = 1; i <= 60; ++i)
    objects.push_back(std::string("\xA2") + i + i);
  objects.emplace_back("\x51x");
  EXPECT_EQ(failureOf(readExactly(binaryDocument(objects))), Failure::tooLarge);
  objects.clear();
  for (char i = 1; i <= 45; ++i)
    objects.push_back(std::string("\xD2\x2E\x2F") + i + i);
  for (const char* key : {"\x51x", "\x51y", "\x51z"})
    objects.emplace_back(key);
  EXPECT_EQ(failureOf(readExactly(binaryDocument(objects))), Failure::tooLarge);
}

TEST(PropertyListHostile, RefusesExpansionToTooMuchText) {
  // One string of 60 KB and lists of lists of it.
  std::string text = std::string("\x5F\x11\xEA\x60", 4) + std::string(60000, 'x');
  std::string document = "bplist00";
  std::vector<std::size_t> offsets;
  for (char level = 1; level <= 4; ++level) {
    offsets.push_back(document.size());
    document += "\xAF\x10\x64" + std::string(100, level);
  }
  offsets.push_back(document.size());
  document += text;
  EXPECT_EQ(failureOf(readExactly(withTable(document, offsets))), Failure::tooLarge);
}

TEST(PropertyListHostile, RefusesOverlappingObjects) {
  for (const OverlappingObjects what :
       {OverlappingObjects::arrays, OverlappingObjects::texts, OverlappingObjects::same})
    EXPECT_EQ(failureOf(readExactly(overlappingDocument(what))), Failure::malformed);
}

TEST(PropertyListHostile, ReadsModeratelySharedContent) {
  std::vector<std::string> objects = {"\xAF\x10\x64" + std::string(100, '\x01'), "\xA4\x02\x02\x03\x03", "\x51x",
                                      "\x5F\x10\x40" + std::string(64, 'y')};
  const auto value = readExactly(binaryDocument(objects));
  ASSERT_TRUE(value.ok()) << outcome(value);
  const Value inner = Array{"x", "x", std::string(64, 'y'), std::string(64, 'y')};
  EXPECT_EQ(*value, Value(Array(100, inner)));
}

TEST(PropertyListHostile, WritersRefuseTooLargeAndTooDeepValues) {
  Value value = "text";
  for (int i = 0; i < 60; ++i)
    value = Array{value, value};
  EXPECT_EQ(plist::writeBinary(value).error().code, static_cast<long>(Failure::tooLarge));
  EXPECT_EQ(plist::writeXML(value).error().code, static_cast<long>(Failure::tooLarge));
  Value deep = "text";
  for (int i = 0; i < 100000; ++i)
    deep = Array{std::move(deep)};
  EXPECT_EQ(plist::writeBinary(deep).error().code, static_cast<long>(Failure::tooDeep));
  EXPECT_EQ(plist::writeXML(deep).error().code, static_cast<long>(Failure::tooDeep));
}

TEST(PropertyListHostile, RefusesPrefixesOfAllFormats) {
  for (const char* text :
       {"bplist", "bplist00", "bplist15", "bplist00<plist>", "<", "<?", "<!", "</", "<a", "\xFE\xFF", "\xFF\xFE",
        "\xEF\xBB\xBF", "\xFE\xFF\0", "<plist><dict><key>", "<!DOCTYPE", "<!DOCTYPE [", "&", "<![CDATA["}) {
    const auto value = readExactly(text);
    EXPECT_FALSE(value.ok()) << text;
  }
}

}  // namespace

}  // namespace appsync::test
