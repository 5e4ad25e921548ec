// Detects the format of a document.
#include <algorithm>

#include "plist/PropertyList.h"
#include "plist/internal/BinaryReader.h"
#include "plist/internal/Failure.h"

namespace appsync::plist {

namespace {

/// Longer than the text before the first significant characters of any document.
constexpr std::size_t kPrefix = 256;

/// Returns the first characters of text in any encoding, without byte-order mark, zero bytes and leading white space.
std::string beginning(ByteView document) {
  std::string start(textOf(document.first(std::min(document.size(), kPrefix))));
  std::erase_if(start, [](char c) { return c == '\0' || static_cast<unsigned char>(c) >= 0x80; });
  start.erase(0, std::min(start.find_first_not_of(" \t\r\n"), start.size()));
  return start;
}

bool isBinary(ByteView document) {
  return textOf(document).starts_with(kMagicOfAnyVersion);
}

/// Both XML and data in the ASCII format begin with '<'; only data has nothing but digits up to the '>'.
bool isXML(ByteView document) {
  const std::string start = beginning(document);
  if (!start.starts_with('<')) return false;
  const std::size_t stop = start.find_first_not_of("0123456789abcdefABCDEF \t\r\n", 1);
  return stop != std::string::npos && start[stop] != '>';
}

}  // namespace

Error rootIsNoDictionary() {
  return failure(Failure::malformed, "The root is not a dictionary");
}

Result<Value> readBinaryOrXML(ByteView document) {
  return isBinary(document) ? readBinary(document) : readXML(document);
}

Result<Value> read(ByteView document) {
  if (isBinary(document)) return readBinary(document);
  return isXML(document) ? readXML(document) : readText(document);
}

Result<Value> read(Bytes&& document) {
  if (!isBinary(document)) return read(ByteView(document));
  return BinaryReader(std::make_shared<const Bytes>(std::move(document))).read();
}

}  // namespace appsync::plist
