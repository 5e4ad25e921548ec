// Reading a document's entries one by one.
#include <cstddef>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "plist/DictionaryStream.h"
#include "tests/plist/Samples.h"

namespace appsync::test {
namespace {

using plist::Dictionary;
using plist::DictionaryStream;
using plist::Failure;
using plist::Value;

using Entries = std::vector<std::pair<std::string, Value>>;

Bytes bytesOfText(std::string_view text) {
  const ByteView bytes = bytesOf(text);
  return {bytes.begin(), bytes.end()};
}

Entries entriesOf(DictionaryStream& document) {
  Entries entries;
  document.visit([&](std::string_view key, const Value& value) { entries.emplace_back(key, value); });
  return entries;
}

Entries entriesOf(const Dictionary& dictionary) {
  Entries entries;
  for (const auto& [key, value] : dictionary)
    entries.emplace_back(key, value);
  return entries;
}

std::string failureOf(const Result<DictionaryStream>& result) {
  return result ? "none" : result.error().text;
}

/// Whatever the document is, read by entries it is what it is as a whole.
void expectAsWhole(std::string_view document) {
  const Result<Value> whole = plist::read(bytesOf(document));
  const Dictionary* dictionary = whole ? whole->dictionary() : nullptr;
  auto entries = DictionaryStream::open(bytesOfText(document));
  ASSERT_EQ(entries.ok(), dictionary != nullptr) << failureOf(entries) << ", as a whole " << outcome(whole);
  if (entries) {
    EXPECT_EQ(entriesOf(*entries), entriesOf(*dictionary));
  } else if (!whole) {
    EXPECT_EQ(entries.error().code, whole.error().code) << failureOf(entries) << ", as a whole " << outcome(whole);
  }
}

std::vector<std::string> documents() {
  return {std::string(textOf(plist::writeBinary(sampleValue()))), std::string(textOf(plist::writeXML(sampleValue()))),
          "{ b = (1, <0f a0>, { d = e; }); a = \"x\"; }"};
}

std::string dictionaryOf(std::string_view references) {
  return std::string(1, static_cast<char>(0xD0 + references.size() / 2)).append(references);
}

TEST(DictionaryStream, VisitsEntriesInKeyOrderInEveryFormat) {
  for (const std::string& document : documents()) {
    auto entries = DictionaryStream::open(bytesOfText(document));
    ASSERT_TRUE(entries) << failureOf(entries);
    EXPECT_EQ(entriesOf(*entries), entriesOf(*plist::read(bytesOf(document))->dictionary()));
  }
}

TEST(DictionaryStream, CanBeVisitedAgain) {
  auto entries = DictionaryStream::open(bytesOfText(documents().front()));
  ASSERT_TRUE(entries);
  const Entries first = entriesOf(*entries);
  EXPECT_EQ(entriesOf(*entries), first);
}

TEST(DictionaryStream, SortsEntriesOfUnsortedDocuments) {
  const std::string document =
      binaryDocument({dictionaryOf("\1\2\3\4\5\6"), "Qc", "Qa", "Qb", "\x10\3", "\x10\1", "\x10\2"});
  auto entries = DictionaryStream::open(bytesOfText(document));
  ASSERT_TRUE(entries) << failureOf(entries);
  EXPECT_EQ(entriesOf(*entries), (Entries{{"a", 1}, {"b", 2}, {"c", 3}}));
}

TEST(DictionaryStream, LastOfEqualKeysWins) {
  const std::string document =
      binaryDocument({dictionaryOf("\1\2\3\4\5\6"), "Qb", "Qa", "Qb", "\x10\1", "\x10\2", "\x10\3"});
  auto entries = DictionaryStream::open(bytesOfText(document));
  ASSERT_TRUE(entries) << failureOf(entries);
  EXPECT_EQ(entriesOf(*entries), (Entries{{"a", 2}, {"b", 3}}));
}

TEST(DictionaryStream, EmptyDictionaryHasNoEntries) {
  auto entries = DictionaryStream::open(bytesOfText(textOf(plist::writeBinary(Dictionary()))));
  ASSERT_TRUE(entries) << failureOf(entries);
  EXPECT_EQ(entriesOf(*entries), Entries{});
}

TEST(DictionaryStream, RefusesRootThatIsNotADictionary) {
  for (const Value& root : {Value(plist::Array{"a"}), Value("text"), Value(7)}) {
    const auto entries = DictionaryStream::open(bytesOfText(textOf(plist::writeBinary(root))));
    EXPECT_EQ(failureOf(entries), "The root is not a dictionary");
  }
}

TEST(DictionaryStream, OpenFailsForAnyInvalidEntry) {
  const std::string document = binaryDocument({dictionaryOf("\1\2\3\4"), "Qa", "Qb", "\x10\1", "\x07"});
  expectAsWhole(document);
  EXPECT_FALSE(DictionaryStream::open(bytesOfText(document)));
}

TEST(DictionaryStream, RefusesNonStringKey) {
  const std::string document = binaryDocument({dictionaryOf("\1\2"), "\x10\1", "\x10\1"});
  expectAsWhole(document);
  EXPECT_FALSE(DictionaryStream::open(bytesOfText(document)));
}

TEST(DictionaryStream, RefusesRootThatContainsItself) {
  const std::string document = binaryDocument({dictionaryOf(std::string_view("\1\0", 2)), "Qa"});
  expectAsWhole(document);
  EXPECT_FALSE(DictionaryStream::open(bytesOfText(document)));
}

TEST(DictionaryStream, RefusesTooLargeExpansion) {
  // Each array holds the next one fourteen times.
  std::vector<std::string> objects{dictionaryOf("\1\2"), "Qa"};
  for (char next = 3; next <= 8; ++next)
    objects.push_back('\xAF' + std::string("\x10\x0E") + std::string(14, next));
  objects.emplace_back("Qx");
  const std::string document = binaryDocument(objects);
  expectAsWhole(document);
  const auto entries = DictionaryStream::open(bytesOfText(document));
  ASSERT_FALSE(entries);
  EXPECT_EQ(entries.error().code, static_cast<long>(Failure::tooLarge)) << failureOf(entries);
}

TEST(DictionaryStream, ReadsSharedContentInEachEntry) {
  const std::string document = binaryDocument({dictionaryOf("\1\2\3\3"), "Qa", "Qb", "\xA2\4\4", "\xA2\5\5", "\x10\1"});
  expectAsWhole(document);
  auto entries = DictionaryStream::open(bytesOfText(document));
  ASSERT_TRUE(entries);
  const plist::Array pair{1, 1};
  const Value both(plist::Array{pair, pair});
  EXPECT_EQ(entriesOf(*entries), (Entries{{"a", both}, {"b", both}}));
}

TEST(DictionaryStream, ReadsDamagedDocumentsLikeTheWhole) {
  for (std::string document : documents()) {
    for (std::size_t size = 0; size < document.size(); ++size)
      expectAsWhole(std::string_view(document).substr(0, size));
    for (std::size_t bit = 0; bit < document.size() * 8; ++bit) {
      const auto flip = static_cast<char>(1U << bit % 8);
      document[bit / 8] = static_cast<char>(document[bit / 8] ^ flip);
      expectAsWhole(document);
      document[bit / 8] = static_cast<char>(document[bit / 8] ^ flip);
    }
  }
}

}  // namespace
}  // namespace appsync::test
