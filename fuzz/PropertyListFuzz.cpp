// Reads the input in every form. Whatever reads must write, and what was written must read back equal.
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <span>
#include <string>

#include "base/PropertyList.h"

namespace {

using namespace appsync;

void require(bool condition) {
  if (!condition) std::abort();
}

void checkBinary(const plist::Value& value) {
  const auto written = plist::writeBinary(value);
  require(written.ok());
  const auto back = plist::readBinary(*written);
  require(back.ok() && *back == value);
}

/// Not every value has an XML form, but what has one keeps everything except fractions of a second.
void checkXML(const plist::Value& value) {
  const auto written = plist::writeXML(value);
  if (!written) return;
  const auto back = plist::readXML(*written);
  require(back.ok());
  const auto again = plist::writeXML(*back);
  require(again.ok() && *again == *written);
}

void check(const Result<plist::Value>& value) {
  if (!value) return require(!value.error().text.empty());
  checkBinary(*value);
  checkXML(*value);
  std::string description;
  plist::appendDescription(description, *value);
  require(description.find('\n') == std::string::npos);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const ByteView document = std::as_bytes(std::span(data, size));
  check(plist::readBinary(document));
  check(plist::readXML(document));
  check(plist::readText(document));
  check(plist::read(document));
  return 0;
}
