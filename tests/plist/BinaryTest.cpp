#include <bit>
#include <optional>
#include <utility>

#include <gtest/gtest.h>

#include "tests/plist/Samples.h"

namespace appsync::test {

namespace {

using plist::Array;
using plist::Date;
using plist::Dictionary;
using plist::Failure;
using plist::Uid;
using plist::Value;

using namespace std::string_literals;

Result<Value> readObjects(const std::vector<std::string>& objects) {
  return plist::readBinary(bytesOf(binaryDocument(objects)));
}

TEST(PropertyListBinary, ReadsWrittenDocuments) {
  const auto document = plist::writeBinary(sampleValue());
  ASSERT_TRUE(document.ok());
  const auto value = plist::readBinary(*document);
  ASSERT_TRUE(value.ok()) << outcome(value);
  EXPECT_EQ(*value, sampleValue());
}

TEST(PropertyListBinary, KeepsUidsRealsAndFractionsOfSeconds) {
  const Value value = Array{Uid{0}, Uid{255}, Uid{256}, Uid{UINT64_MAX}, Date{0.5}, 1e300, -0.0, "a\0\x01\r"s};
  const auto read = plist::readBinary(*plist::writeBinary(value));
  ASSERT_TRUE(read.ok()) << outcome(read);
  EXPECT_EQ(*read, value);
}

TEST(PropertyListBinary, LongDataRefersToMovedDocument) {
  const Bytes data(5'000, std::byte{7});
  const Dictionary value{{"long", data}, {"again", data}, {"short", Value::data(bytesOf("short"))}, {"text", "text"}};
  Bytes document = *plist::writeBinary(value);
  const std::byte* begin = document.data();
  const std::byte* end = begin + document.size();
  std::optional<Value> kept;
  {
    auto read = plist::read(std::move(document));
    ASSERT_TRUE(read.ok()) << outcome(read);
    EXPECT_EQ(*read, Value(value));
    for (const char* key : {"long", "again"}) {
      const std::byte* place = read->find(key)->data()->data();
      EXPECT_TRUE(place > begin && place < end) << key;
    }
    const std::byte* place = read->find("short")->data()->data();
    EXPECT_TRUE(place < begin || place >= end);
    kept = *read->find("long");
  }
  EXPECT_EQ(*kept, Value(data)) << "data keeps the document";
}

TEST(PropertyListBinary, ReadsMovedDocumentsOfEveryFormat) {
  const Value value = Dictionary{{"data", Bytes(5'000, std::byte{7})}};
  auto xml = plist::read(std::move(plist::writeXML(value)).value());
  ASSERT_TRUE(xml.ok()) << outcome(xml);
  EXPECT_EQ(*xml, value);
  EXPECT_EQ(plist::read(Bytes()).ok(), plist::read(ByteView()).ok());
  Bytes broken = *plist::writeBinary(value);
  broken.resize(broken.size() / 2);
  const Error failure = plist::read(ByteView(broken)).error();
  EXPECT_EQ(plist::read(std::move(broken)).error(), failure);
}

TEST(PropertyListBinary, EqualValuesGiveEqualBytes) {
  Value built = Dictionary{};
  for (const char* key : {"c", "a", "b"})
    built.dictionary()->set(key, std::string("text"));
  const Value listed = Dictionary{{"a", "text"}, {"b", "text"}, {"c", "text"}};
  EXPECT_EQ(textOf(plist::writeBinary(built)), textOf(plist::writeBinary(listed)));
}

TEST(PropertyListBinary, WritesKnownBytes) {
  const auto document = plist::writeBinary(Dictionary{{"a", Array{1, true, "a"}}});
  const std::string objects =
      "bplist00"
      "\x10\x01"
      "\x09"
      "\x51"
      "a"
      "\xA3\x00\x01\x02"
      "\xD1\x02\x03"s;
  const std::string end = "\x08\x0A\x0B\x0D\x11"s + std::string(6, '\0') + "\x01\x01" + std::string(7, '\0') + "\x05" +
                          std::string(7, '\0') + "\x04" + std::string(7, '\0') + "\x14";
  EXPECT_EQ(textOf(document), objects + end);
}

TEST(PropertyListBinary, StoresEqualScalarsOnce) {
  const std::string text(1000, 'x');
  const Bytes data(2000, std::byte{7});
  const auto document = plist::writeBinary(Array{text, text, Dictionary{{text, text}}, data, data});
  ASSERT_TRUE(document.ok());
  EXPECT_LT(document->size(), 3200U);
}

TEST(PropertyListBinary, WidensReferencesForManyObjects) {
  for (const int count : {254, 255, 256, 65534, 65535, 65536, 70000}) {
    Array numbers;
    for (int i = 0; i < count; ++i)
      numbers.push_back(i);
    const Value value = Dictionary{{"numbers", std::move(numbers)}};
    const auto read = plist::readBinary(*plist::writeBinary(value));
    ASSERT_TRUE(read.ok()) << count << ": " << outcome(read);
    EXPECT_EQ(*read, value) << count;
  }
}

TEST(PropertyListBinary, DictionariesOfManyShapesKeepTheirKeys) {
  Array entries;
  for (int i = 0; i < 2000; ++i) {
    Dictionary entry;
    for (int key = 0; key < 5; ++key)
      entry.set("key" + std::to_string(i % 300 + key * 7), i);
    entries.push_back(Dictionary{{"inner", entry}, {"key" + std::to_string(i % 90), i}});
  }
  const Value value = entries;
  const auto read = plist::readBinary(*plist::writeBinary(value));
  ASSERT_TRUE(read.ok()) << outcome(read);
  EXPECT_EQ(*read, value);
  EXPECT_EQ(textOf(plist::writeBinary(*read)), textOf(plist::writeBinary(value)));
}

TEST(PropertyListBinary, RefusesToWriteNull) {
  for (const Value& value : {Value(), Value(Array{1, Value()}), Value(Dictionary{{"a", Value()}})}) {
    const auto document = plist::writeBinary(value);
    ASSERT_FALSE(document.ok());
    EXPECT_EQ(document.error().domain, domains::kPropertyList);
    EXPECT_EQ(document.error().code, static_cast<long>(Failure::notRepresentable));
    EXPECT_EQ(document.error().text, "A property list cannot hold a null");
  }
}

TEST(PropertyListBinary, RefusesToWriteTextThatIsNotUTF8) {
  EXPECT_FALSE(plist::writeBinary(Value("\xFF")).ok());
  EXPECT_FALSE(plist::writeBinary(Value("\xED\xA0\x80")).ok());
  EXPECT_FALSE(plist::writeBinary(Value(Dictionary{{"a long key with a bad byte at its end \xC3", 1}})).ok());
}

TEST(PropertyListBinary, RefusesToWriteDatesOutsideTheCalendar) {
  EXPECT_FALSE(plist::writeBinary(Value(Date{1e300})).ok());
  EXPECT_FALSE(plist::writeBinary(Value(Date{std::numeric_limits<double>::quiet_NaN()})).ok());
}

TEST(PropertyListBinary, RefusesTooDeepNesting) {
  Value value = Array{};
  for (int depth = 1; depth < plist::kMaximumDepth; ++depth)
    value = Array{std::move(value)};
  const auto document = plist::writeBinary(value);
  ASSERT_TRUE(document.ok());
  EXPECT_EQ(*plist::readBinary(*document), value);
  value = Array{std::move(value)};
  EXPECT_FALSE(plist::writeBinary(value).ok());
}

TEST(PropertyListBinary, ReadsIntegersOfEverySize) {
  EXPECT_EQ(*readObjects({"\x10\xFF"}), Value(255));
  EXPECT_EQ(*readObjects({"\x11\xFF\xFE"}), Value(65534));
  EXPECT_EQ(*readObjects({"\x12\xFF\xFF\xFF\xFF"}), Value(4294967295));
  EXPECT_EQ(*readObjects({"\x13\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF"}), Value(-1));
  EXPECT_EQ(*readObjects({"\x14"s + std::string(8, '\0') + std::string(8, '\xFF')}), Value(UINT64_MAX));
  EXPECT_EQ(*readObjects({"\x14"s + std::string(16, '\xFF')}), Value(-1));
}

TEST(PropertyListBinary, RefusesIntegersBeyond64Bits) {
  EXPECT_EQ(failureOf(readObjects({"\x14"s + std::string(7, '\0') + "\x01" + std::string(8, '\0')})),
            Failure::outOfRange);
  EXPECT_EQ(failureOf(readObjects({"\x14"s + std::string(8, '\xFF') + std::string(8, '\0')})), Failure::outOfRange);
  EXPECT_EQ(failureOf(readObjects({"\x15"s + std::string(32, '\0')})), Failure::outOfRange);
}

TEST(PropertyListBinary, ReadsRealsOfBothSizes) {
  EXPECT_EQ(*readObjects({"\x22\x3F\xC0\0\0"s}), Value(1.5));
  EXPECT_EQ(*readObjects({"\x23\x3F\xF8\0\0\0\0\0\0"s}), Value(1.5));
  EXPECT_EQ(failureOf(readObjects({"\x21\0\0"s})), Failure::malformed);
}

TEST(PropertyListBinary, ReadsUidsOfOneToEightBytes) {
  EXPECT_EQ(*readObjects({"\x80\x07"}), Value(Uid{7}));
  EXPECT_EQ(*readObjects({"\x82\x01\x02\x03"}), Value(Uid{0x010203}));
  EXPECT_EQ(*readObjects({"\x87"s + std::string(8, '\xFF')}), Value(Uid{UINT64_MAX}));
  EXPECT_EQ(failureOf(readObjects({"\x88"s + std::string(9, '\0')})), Failure::outOfRange);
}

TEST(PropertyListBinary, LastOfEqualKeysWins) {
  EXPECT_EQ(*readObjects({"\xD2\x01\x01\x02\x03"s, "\x51k", "\x10\x01", "\x10\x02"}), Value(Dictionary{{"k", 2}}));
  EXPECT_EQ(*readObjects({"\xD2\x01\x02\x03\x04"s, "\x51k", "\x51k", "\x10\x01", "\x10\x02"}),
            Value(Dictionary{{"k", 2}}));
}

TEST(PropertyListBinary, AcceptsKeysInAnyOrder) {
  const auto value = readObjects({"\xA2\x01\x01"s, "\xD3\x02\x03\x04\x05\x06\x07"s,
                                  "\x51"
                                  "c",
                                  "\x51"
                                  "a",
                                  "\x51"
                                  "b",
                                  "\x10\x03", "\x10\x01", "\x10\x02"});
  const Dictionary entry{{"a", 1}, {"b", 2}, {"c", 3}};
  ASSERT_TRUE(value.ok()) << outcome(value);
  EXPECT_EQ(*value, Value(Array{entry, entry}));
}

TEST(PropertyListBinary, RefusesNonStringKeys) {
  EXPECT_EQ(failureOf(readObjects({"\xD1\x01\x01"s, "\x10\x01"})), Failure::malformed);
}

TEST(PropertyListBinary, RefusesNullsAndSets) {
  EXPECT_EQ(failureOf(readObjects({"\0"s})), Failure::unsupported);
  EXPECT_EQ(failureOf(readObjects({"\x0F"})), Failure::unsupported);
  EXPECT_EQ(failureOf(readObjects({"\xC1\x01", "\x10\x01"})), Failure::unsupported);
  EXPECT_EQ(failureOf(readObjects({"\x70"})), Failure::malformed);
}

TEST(PropertyListBinary, RefusesTextThatIsNotInItsEncoding) {
  EXPECT_EQ(failureOf(readObjects({"\x51\xE9"})), Failure::badText);
  EXPECT_EQ(failureOf(readObjects({"\x5F\x10\x20"s + std::string(31, 'x') + "\xE9"})), Failure::badText);
  EXPECT_EQ(failureOf(readObjects({"\x61\xD8\x3D"})), Failure::badText);
  EXPECT_EQ(failureOf(readObjects({"\x62\xDE\x00\xD8\x3D"s})), Failure::badText);
  EXPECT_EQ(*readObjects({"\x62\xD8\x3D\xDE\x00"s}), Value("😀"));
}

TEST(PropertyListBinary, RefusesDatesOutsideTheCalendar) {
  for (const double seconds : {1e300, -1e12, std::numeric_limits<double>::infinity()}) {
    std::string object = "\x33";
    for (int shift = 56; shift >= 0; shift -= 8)
      object += static_cast<char>(std::bit_cast<std::uint64_t>(seconds) >> shift);
    EXPECT_EQ(failureOf(readObjects({object})), Failure::outOfRange);
  }
}

TEST(PropertyListBinary, ErrorsNameTheByte) {
  EXPECT_EQ(outcome(readObjects({"\xA1\x01", "\x70"})), "An object of unknown type at byte 10");
  EXPECT_EQ(outcome(plist::readBinary(bytesOf("nothing"))), "Not a binary property list at byte 0");
}

}  // namespace

}  // namespace appsync::test
