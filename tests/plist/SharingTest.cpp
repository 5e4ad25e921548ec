// Documents that refer to the same text and data again and again: every document that is written can be read.
#include <array>
#include <cstdint>
#include <random>
#include <string>
#include <utility>

#include <gtest/gtest.h>

#include "plist/DictionaryStream.h"
#include "tests/plist/Samples.h"

namespace appsync::test {
namespace {

using plist::Array;
using plist::Date;
using plist::Dictionary;
using plist::DictionaryStream;
using plist::Failure;
using plist::Value;

constexpr std::size_t kIcon = 65'536;
constexpr std::size_t kIcons = 10'000;

Dictionary entriesOf(Bytes document) {
  auto entries = DictionaryStream::open(std::move(document));
  EXPECT_TRUE(entries.ok()) << (entries ? "" : entries.error().text);
  Dictionary found;
  if (entries) entries->visit([&](std::string_view key, const Value& value) { found.set(key, value); });
  return found;
}

void expectSameInBinary(const Dictionary& root) {
  const auto document = plist::writeBinary(root);
  ASSERT_TRUE(document.ok()) << document.error().text;
  const auto back = plist::readBinary(*document);
  ASSERT_TRUE(back.ok()) << outcome(back);
  EXPECT_EQ(*back, Value(root));
  const auto given = plist::read(Bytes(*document));
  ASSERT_TRUE(given.ok()) << outcome(given);
  EXPECT_EQ(*given, Value(root));
  EXPECT_EQ(entriesOf(*document), root);
  EXPECT_EQ(*plist::writeBinary(*back), *document);
}

void expectSameInXML(const Dictionary& root) {
  const auto document = plist::writeXML(root);
  ASSERT_TRUE(document.ok()) << document.error().text;
  const auto back = plist::readXML(*document);
  ASSERT_TRUE(back.ok()) << outcome(back);
  EXPECT_EQ(*back, Value(root));
}

/// Makes values of few different parts, many of them long and most of them used often. The same seed gives the same.
class RandomValues {
 public:
  RandomValues(std::uint32_t seed, std::size_t longest) : random_(seed), longest_(longest) {
    for (Value& part : parts_)
      part = newPart();
    for (std::string& key : keys_)
      key = text(below(8) == 0 ? below(longest_ / 20) : below(40)) + std::to_string(below(1'000));
  }

  Dictionary dictionary(int depth) {
    Dictionary made;
    for (std::size_t left = below(depth == 0 ? 300 : 12); left > 0; --left)
      made.set(keys_[below(keys_.size())] + (depth == 0 ? std::to_string(left) : ""), value(depth + 1));
    return made;
  }

 private:
  std::size_t below(std::size_t limit) { return random_() % limit; }

  std::string text(std::size_t size) {
    static constexpr std::array<const char*, 6> kCharacters = {"a", "Z", "<", "é", "旅", "😀"};
    const std::size_t kinds = below(2) == 0 ? 3 : kCharacters.size();
    std::string made;
    while (made.size() < size)
      made += kCharacters[below(kinds)];
    return made;
  }

  Value newPart() {
    switch (below(8)) {
      case 0:
        return text(below(longest_));
      case 1:
      case 2:
        return Bytes(below(longest_), static_cast<std::byte>(below(256)));
      case 3:
        return Date{static_cast<double>(below(1'000'000))};
      case 4:
        return static_cast<double>(below(1'000)) / 8;
      case 5:
        return below(70'000);
      case 6:
        return below(2) == 0;
      default:
        return text(below(60));
    }
  }

  Value value(int depth) {
    const std::size_t kind = below(10);
    if (depth == 4 || kind < 6) return parts_[below(parts_.size())];
    if (kind < 8) return dictionary(depth);
    if (kind == 8) return Array(below(200), parts_[below(parts_.size())]);
    Array made;
    for (std::size_t left = below(20); left > 0; --left)
      made.push_back(value(depth + 1));
    return made;
  }

  std::mt19937 random_;
  std::size_t longest_;
  std::array<Value, 12> parts_;
  std::array<std::string, 20> keys_;
};

TEST(PropertyListSharing, RestoresRandomDocumentsFromBinary) {
  for (std::uint32_t seed = 1; seed <= 10; ++seed) {
    SCOPED_TRACE(seed);
    expectSameInBinary(RandomValues(seed, 10'000).dictionary(0));
  }
}

TEST(PropertyListSharing, RestoresRandomDocumentsFromXML) {
  for (std::uint32_t seed = 1; seed <= 6; ++seed) {
    SCOPED_TRACE(seed);
    expectSameInXML(RandomValues(seed, 1'000).dictionary(0));
  }
}

TEST(PropertyListSharing, ReadsAppsThatShareOneIcon) {
  Dictionary apps;
  for (int app = 0; app < 34; ++app)
    apps.set("org.app" + std::to_string(app), Dictionary{{"PlaceholderIcon", Bytes(262'144, std::byte{5})}});
  expectSameInBinary(apps);
}

TEST(PropertyListSharing, ReadsTenThousandEqualIcons) {
  const Value icon(Bytes(kIcon, std::byte{5}));
  expectSameInBinary(Dictionary{{"icons", Array(kIcons, icon)}});
}

TEST(PropertyListSharing, ReadsTenThousandEqualTexts) {
  const Value text(std::string(kIcon, 'x'));
  expectSameInBinary(Dictionary{{"texts", Array(kIcons, text)}});
}

TEST(PropertyListSharing, ReadsEqualLongKeysInManyShapes) {
  const std::string key(kIcon, 'k');
  Array dictionaries;
  for (int i = 0; i < 1'000; ++i)
    dictionaries.push_back(Dictionary{{key, i}, {key + "l", i}, {std::to_string(i), i}});
  expectSameInBinary(Dictionary{{"dictionaries", std::move(dictionaries)}});
}

/// Object 0 is an array of `count` references to object 1.
std::string listOf(std::string_view object, std::uint16_t count) {
  std::string list = "bplist00\xAF\x11";
  list += {static_cast<char>(count >> 8), static_cast<char>(count & 0xFF)};
  list += std::string(count, '\x01');
  const std::size_t offset = list.size();
  return withTable(list.append(object), {8, offset});
}

TEST(PropertyListSharing, ReadsEqualIconsOfOtherWriters) {
  const std::string icon = "\x4F\x11\x30\x39" + std::string(0x3039, 'x');
  const auto value = plist::readBinary(bytesOf(listOf(icon, kIcons)));
  ASSERT_TRUE(value.ok()) << outcome(value);
  ASSERT_EQ(value->array()->size(), kIcons);
  EXPECT_EQ((*value->array())[kIcons - 1].data()->size(), 0x3039U);
}

/// Three levels of arrays, each of which holds the next level a hundred times, and the last one a long object.
std::string millionReferences(std::string_view header) {
  std::string document = "bplist00";
  std::vector<std::size_t> offsets;
  for (char level = 1; level <= 3; ++level) {
    offsets.push_back(document.size());
    document += "\xAF\x10\x64" + std::string(100, level);
  }
  offsets.push_back(document.size());
  return withTable(document.append(header).append(60'000, 'x'), offsets);
}

TEST(PropertyListSharing, RefusesTextThatExpandsBeyondMemory) {
  EXPECT_EQ(failureOf(plist::readBinary(bytesOf(millionReferences("\x5F\x11\xEA\x60")))), Failure::tooLarge);
}

TEST(PropertyListSharing, ConvertsDataThatExpandsBeyondMemory) {
  const auto value = plist::readBinary(bytesOf(millionReferences("\x4F\x11\xEA\x60")));
  ASSERT_TRUE(value.ok()) << outcome(value);
  EXPECT_GT(plist::expandedSize(*value), plist::kMaximumExpandedSize);
  EXPECT_EQ(plist::writeXML(*value).error().code, static_cast<long>(Failure::tooLarge));
  std::string description;
  plist::appendDescription(description, *value);
  EXPECT_LT(description.size(), 2'000'000U);
  const auto written = plist::writeBinary(*value);
  ASSERT_TRUE(written.ok());
  EXPECT_EQ(*plist::readBinary(*written), *value);
}

TEST(PropertyListSharing, WriterRefusesTextTheReaderRefuses) {
  const Array texts(2 * kIcons, std::string(kIcon, 'x'));
  EXPECT_EQ(plist::writeBinary(texts).error().text, "Too much text for one property list");
  const std::string key(kIcon, 'x');
  Array keys;
  for (std::size_t i = 0; i < 2 * kIcons; ++i)
    keys.push_back(Dictionary{{key, 1}, {std::to_string(i), 1}});
  EXPECT_EQ(plist::writeBinary(keys).error().text, "Too much text for one property list");
}

Value nested(int depth, const auto& wrap) {
  Value value = wrap(Value());
  for (int i = 1; i < depth; ++i)
    value = wrap(std::move(value));
  return value;
}

TEST(PropertyListSharing, ReadsTheDeepestNestingThatIsWritten) {
  const auto inArray = [](Value inner) { return Value(inner.isNull() ? Array{} : Array{std::move(inner)}); };
  const auto inDictionary = [](Value inner) {
    return Value(inner.isNull() ? Dictionary{} : Dictionary{{"k", std::move(inner)}});
  };
  for (const Value& deepest : {nested(plist::kMaximumDepth, inArray), nested(plist::kMaximumDepth, inDictionary)}) {
    EXPECT_EQ(*plist::readBinary(*plist::writeBinary(deepest)), deepest);
    EXPECT_EQ(*plist::readXML(*plist::writeXML(deepest)), deepest);
    if (deepest.dictionary() != nullptr) {
      EXPECT_EQ(Value(entriesOf(*plist::writeBinary(deepest))), deepest);
    }
    for (const Value& tooDeep : {inArray(deepest), inDictionary(deepest)}) {
      EXPECT_EQ(plist::writeBinary(tooDeep).error().code, static_cast<long>(Failure::tooDeep));
      EXPECT_EQ(plist::writeXML(tooDeep).error().code, static_cast<long>(Failure::tooDeep));
    }
  }
}

}  // namespace
}  // namespace appsync::test
