// Tells the three forms apart.
#include <algorithm>

#include "plist/PropertyList.h"
#include "plist/internal/BinaryReader.h"

namespace appsync::plist {

namespace {

/// More than any document has before its first telling characters.
constexpr std::size_t kPrefix = 256;

/// The first characters of text in any encoding: no byte-order mark, no zero bytes of UTF-16, no leading white space.
std::string beginning(ByteView document) {
  std::string start(textOf(document.first(std::min(document.size(), kPrefix))));
  std::erase_if(start, [](char c) { return c == '\0' || static_cast<unsigned char>(c) >= 0x80; });
  start.erase(0, std::min(start.find_first_not_of(" \t\r\n"), start.size()));
  return start;
}

bool isBinary(ByteView document) {
  return textOf(document).starts_with("bplist");
}

/// Both XML and data in the old text form begin with '<'; only the latter goes on with nothing but digits.
bool isXML(ByteView document) {
  const std::string start = beginning(document);
  if (!start.starts_with('<')) return false;
  const std::size_t stop = start.find_first_not_of("0123456789abcdefABCDEF \t\r\n", 1);
  return stop != std::string::npos && start[stop] != '>';
}

}  // namespace

Error rootIsNoDictionary() {
  return failure(Failure::malformed, "The root is no dictionary");
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
