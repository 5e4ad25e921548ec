// What a document may take of the memory of whoever reads it.
#include <algorithm>
#include <cstddef>
#include <string>
#include <utility>

#include <gtest/gtest.h>

#include "plist/DictionaryStream.h"
#include "tests/plist/Samples.h"
#include "tests/support/HeldMemory.h"

namespace appsync::test {
namespace {

/// One byte is the least that an element takes of a document, and a value the most that it takes of memory; twice,
/// because what is referred to again is read again, to be shared from then on.
constexpr std::size_t kMostPerByte = 2 * sizeof(plist::Value);

std::size_t mostHeldReading(const std::string& document) {
  return memory::mostHeldDuring([&] { static_cast<void>(plist::readBinary(bytesOf(document))); });
}

TEST(PropertyListMemory, IsProportionalToTheDocument) {
  constexpr std::size_t kElements = 0x6060;
  std::string list = "bplist00\xAF\x11\x60\x60" + std::string(kElements, '\x01') + '\x09';
  const std::string document = withTable(list, {8, list.size() - 1});
  EXPECT_TRUE(plist::readBinary(bytesOf(document)).ok());
  EXPECT_GE(mostHeldReading(document), kElements * sizeof(plist::Value));
  EXPECT_LE(mostHeldReading(document), document.size() * kMostPerByte);
}

TEST(PropertyListMemory, IsProportionalDespiteOverlappingObjects) {
  for (const OverlappingObjects what :
       {OverlappingObjects::arrays, OverlappingObjects::texts, OverlappingObjects::same}) {
    const std::string document = overlappingDocument(what);
    EXPECT_LE(mostHeldReading(document), document.size() * kMostPerByte);
  }
}

TEST(PropertyListMemory, HoldsTenThousandEqualIconsOnce) {
  constexpr std::size_t kIcons = 10'000;
  constexpr std::size_t kIcon = 65'536;
  plist::Dictionary apps;
  const plist::Value icon(Bytes(kIcon, std::byte{5}));
  for (std::size_t app = 0; app < kIcons; ++app)
    apps.set("org.app" + std::to_string(app), plist::Dictionary{{"PlaceholderIcon", icon}});
  const std::string document(textOf(plist::writeBinary(apps)));
  EXPECT_LT(document.size(), kIcon + kIcons * 32);
  EXPECT_TRUE(plist::readBinary(bytesOf(document)).ok());
  EXPECT_LE(mostHeldReading(document), document.size() * kMostPerByte);
  Bytes given(document.size());
  std::ranges::copy(bytesOf(document), given.begin());
  const std::size_t held = memory::mostHeldDuring([&] {
    auto entries = plist::DictionaryStream::open(std::move(given));
    ASSERT_TRUE(entries.ok()) << entries.error().text;
    entries->visit([](std::string_view, const plist::Value&) {});
  });
  EXPECT_LE(held, 2 * document.size());
}

}  // namespace
}  // namespace appsync::test
