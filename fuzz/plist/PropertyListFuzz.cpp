// Reads the input in every format. A value that is read must be written, and the written document read back equal.
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <span>
#include <string>

#include "base/Message.h"
#include "plist/DictionaryStream.h"

namespace {

using namespace appsync;

void require(bool condition) {
  if (!condition) std::abort();
}

/// Formats that repeat shared content are checked up to this size only, to save time.
constexpr std::size_t kMostExpanded = std::size_t{1} << 24;

template <class T>
bool isTooMuch(const Result<T>& result) {
  using plist::Failure;
  return !result && (result.error().code == static_cast<long>(Failure::tooLarge) ||
                     result.error().code == static_cast<long>(Failure::tooDeep));
}

void checkBinary(const plist::Value& value) {
  const auto written = plist::writeBinary(value);
  if (isTooMuch(written) && plist::expandedSize(value) > kMostExpanded) return;
  require(written.ok());
  const auto back = plist::readBinary(*written);
  require(back.ok() && *back == value);
}

/// Not every value has an XML document, but one that has keeps everything except fractions of a second.
void checkXML(const plist::Value& value) {
  if (plist::expandedSize(value) > kMostExpanded) return;
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
  require(formatMessage("%{public}@", *value).find('\n') == std::string::npos);
}

/// Requires the stream to have the content of the whole document. Shared content counts for each entry, so that only
/// one of the two may exceed the expansion limits.
void checkEntries(ByteView document, const Result<plist::Value>& whole) {
  auto entries = plist::DictionaryStream::open(Bytes(document.begin(), document.end()));
  if (isTooMuch(whole) || isTooMuch(entries)) return;
  const plist::Dictionary* expected = whole ? whole->dictionary() : nullptr;
  require(entries.ok() == (expected != nullptr));
  if (!entries) return;
  plist::Dictionary found;
  entries->visit([&](std::string_view key, const plist::Value& value) {
    require(!found.contains(key));
    found.set(key, value);
  });
  require(found == *expected);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const ByteView document = std::as_bytes(std::span(data, size));
  check(plist::readBinary(document));
  check(plist::readXML(document));
  check(plist::readText(document));
  const auto whole = plist::read(document);
  check(whole);
  checkEntries(document, whole);
  return 0;
}
