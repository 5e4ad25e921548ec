// What a document may take of the memory of whoever reads it.
#include <cstddef>
#include <string>

#include <gtest/gtest.h>

#include "tests/HeldMemory.h"
#include "tests/base/PropertyListSamples.h"

namespace appsync::test {
namespace {

/// One byte is the least that an element takes of a document, and a value the most that it takes of memory; twice,
/// because what is referred to again is read again, to be shared from then on.
constexpr std::size_t kMostPerByte = 2 * sizeof(plist::Value);

std::size_t mostHeldReading(const std::string& document) {
  return memory::mostHeldDuring([&] { static_cast<void>(plist::readBinary(bytesOf(document))); });
}

TEST(PropertyListMemory, IsInProportionToTheDocument) {
  constexpr std::size_t kElements = 0x6060;
  std::string list = "bplist00\xAF\x11\x60\x60" + std::string(kElements, '\x01') + '\x09';
  const std::string document = withTable(list, {8, list.size() - 1});
  EXPECT_TRUE(plist::readBinary(bytesOf(document)).ok());
  EXPECT_GE(mostHeldReading(document), kElements * sizeof(plist::Value));
  EXPECT_LE(mostHeldReading(document), document.size() * kMostPerByte);
}

TEST(PropertyListMemory, IsInProportionToADocumentWhoseObjectsLieInEachOther) {
  for (const OverlappingObjects what :
       {OverlappingObjects::arrays, OverlappingObjects::texts, OverlappingObjects::same}) {
    const std::string document = overlappingDocument(what);
    EXPECT_LE(mostHeldReading(document), document.size() * kMostPerByte);
  }
}

}  // namespace
}  // namespace appsync::test
