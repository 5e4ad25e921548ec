// Reads the XML format.
#include <algorithm>
#include <array>
#include <charconv>
#include <cmath>
#include <iterator>

#include "plist/internal/Base64.h"
#include "plist/internal/Date.h"
#include "plist/internal/Encoding.h"
#include "plist/internal/Failure.h"
#include "plist/internal/Storage.h"
#include "plist/internal/XMLScanner.h"

namespace appsync::plist {

namespace {

constexpr std::string_view kSpace = " \t\r\n";

enum class NumberOutcome { parsed, malformed, outOfRange };

bool takeSign(std::string_view& text) noexcept {
  const bool isNegative = text.starts_with('-');
  if (isNegative || text.starts_with('+')) text.remove_prefix(1);
  return isNegative;
}

template <class T, class... Base>
NumberOutcome parseWhole(std::string_view text, T& number, Base... base) noexcept {
  const char* end = text.data() + text.size();
  const auto [stop, error] = std::from_chars(text.data(), end, number, base...);
  if (error == std::errc::invalid_argument || stop != end) return NumberOutcome::malformed;
  return error == std::errc{} ? NumberOutcome::parsed : NumberOutcome::outOfRange;
}

/// Returns `text` without leading and trailing white space.
std::string_view trimmed(std::string_view text) noexcept {
  const std::size_t first = text.find_first_not_of(kSpace);
  if (first == std::string_view::npos) return {};
  return text.substr(first, text.find_last_not_of(kSpace) - first + 1);
}

/// Parses a decimal integer, or a hexadecimal one after 0x, with an optional sign, that fits in a signed or an unsigned
/// 64-bit integer.
NumberOutcome parseInteger(std::string_view text, Value& number) noexcept {
  const bool isNegative = takeSign(text);
  const bool isHexadecimal = text.starts_with("0x") || text.starts_with("0X");
  if (isHexadecimal) text.remove_prefix(2);
  std::uint64_t magnitude = 0;
  const NumberOutcome outcome = parseWhole(text, magnitude, isHexadecimal ? 16 : 10);
  if (outcome != NumberOutcome::parsed) return outcome;
  if (!isNegative) {
    number = magnitude;
    return NumberOutcome::parsed;
  }
  if (magnitude > std::uint64_t{1} << 63) return NumberOutcome::outOfRange;
  number = static_cast<std::int64_t>(0 - magnitude);
  return NumberOutcome::parsed;
}

/// Parses a decimal number with an optional exponent, "nan", "inf" or "infinity", with an optional sign. A magnitude
/// too small for a double becomes zero.
NumberOutcome parseReal(std::string_view text, double& number) noexcept {
  const bool isNegative = takeSign(text);
  if (text.starts_with('-') || text.find('(') != std::string_view::npos) return NumberOutcome::malformed;
  NumberOutcome outcome = parseWhole(text, number);
  if (outcome == NumberOutcome::outOfRange) {
    // Too large or too small for a double: a wider type distinguishes the two.
    long double wide = 0;
    outcome = parseWhole(text, wide);
    number = static_cast<double>(wide);
    if (outcome == NumberOutcome::parsed && std::isinf(number)) return NumberOutcome::outOfRange;
  }
  if (isNegative) number = -number;
  return outcome;
}

class XMLReader {
 public:
  explicit XMLReader(std::string_view text) noexcept : scanner_(text) {}

  Result<Value> read() {
    Value root = readRoot();
    if (!scanner_.failed()) scanner_.expectEnd();
    if (scanner_.failed()) return scanner_.takeFailure();
    return root;
  }

 private:
  /// The keys of the previous dictionary at one depth. The next one there most likely has the same keys.
  struct Level {
    DictionaryPool pool;
    /// In document order.
    std::vector<Value> keys;
    std::vector<std::uint32_t> places;
  };

  Value fail(Failure kind, std::string_view what) {
    scanner_.fail(kind, what);
    return {};
  }

  Value readRoot();
  Value readValue(const Tag& tag, int depth);
  Value readScalar(const Tag& tag);
  Value readInteger(std::string_view text);
  Value readReal(std::string_view text);
  Value readDate(std::string_view text);
  Value readData(const Tag& tag);
  Value readArray(const Tag& tag, int depth);
  Value readDictionary(const Tag& tag, int depth);
  bool readEntry(const Tag& tag, Level& level, std::size_t& matched, std::size_t firstKey, int depth);
  void materializeKeys(const Level& level, std::size_t matched, std::size_t firstKey);
  Value finishDictionary(Level& level, std::size_t matched, std::size_t firstKey, std::size_t firstValue);

  XMLScanner scanner_;
  std::array<std::unique_ptr<Level>, kMaximumDepth + 1> levels_;
  /// Keys and values of the open containers, innermost last.
  std::vector<Value> keys_;
  std::vector<Value> values_;
};

Value XMLReader::readRoot() {
  scanner_.readProlog();
  Tag tag = scanner_.readTag();
  const bool isWrapped = tag.element == Element::plist && tag.kind == Tag::Kind::open;
  if (isWrapped) tag = scanner_.readTag();
  if (scanner_.failed()) return {};
  Value root = readValue(tag, 0);
  if (isWrapped && !scanner_.failed()) {
    const Tag close = scanner_.readTag();
    const bool isClose = close.element == Element::plist && close.kind == Tag::Kind::close;
    if (!isClose) return fail(Failure::malformed, "More than one value");
  }
  return root;
}

Value XMLReader::readValue(const Tag& tag, int depth) {
  if (tag.kind == Tag::Kind::close) return fail(Failure::malformed, "A closing tag in place of a value");
  switch (tag.element) {
    case Element::array:
      return readArray(tag, depth + 1);
    case Element::dict:
      return readDictionary(tag, depth + 1);
    case Element::data:
      return readData(tag);
    case Element::key:
    case Element::plist:
    case Element::unknown:
      return fail(Failure::malformed, "An element that is not a value");
    default:
      return readScalar(tag);
  }
}

Value XMLReader::readScalar(const Tag& tag) {
  const std::string_view text = scanner_.readCharacters(tag);
  if (scanner_.failed()) return {};
  switch (tag.element) {
    case Element::string:
      return text;
    case Element::integer:
      return readInteger(trimmed(text));
    case Element::real:
      return readReal(trimmed(text));
    case Element::date:
      return readDate(trimmed(text));
    default:
      if (!trimmed(text).empty()) return fail(Failure::malformed, "Text in a boolean");
      return tag.element == Element::trueElement;
  }
}

Value XMLReader::readInteger(std::string_view text) {
  Value number;
  switch (parseInteger(text, number)) {
    case NumberOutcome::parsed:
      return number;
    case NumberOutcome::outOfRange:
      return fail(Failure::outOfRange, "An integer that does not fit in 64 bits before");
    default:
      return fail(Failure::malformed, "An invalid integer before");
  }
}

Value XMLReader::readReal(std::string_view text) {
  double number = 0;
  switch (parseReal(text, number)) {
    case NumberOutcome::parsed:
      return number;
    case NumberOutcome::outOfRange:
      return fail(Failure::outOfRange, "A real too large before");
    default:
      return fail(Failure::malformed, "An invalid real before");
  }
}

Value XMLReader::readDate(std::string_view text) {
  if (const auto date = parseDate(text)) return *date;
  return fail(Failure::outOfRange, "A date that does not exist before");
}

Value XMLReader::readData(const Tag& tag) {
  Bytes bytes;
  if (const auto raw = scanner_.rawCharacters(tag); raw && !decodeBase64(*raw, bytes)) {
    scanner_.skipRawCharacters(tag, *raw);
    return bytes;
  }
  const std::string_view text = scanner_.readCharacters(tag);
  if (scanner_.failed()) return {};
  if (decodeBase64(text, bytes)) return fail(Failure::malformed, "Invalid Base64 before");
  return bytes;
}

Value XMLReader::readArray(const Tag& tag, int depth) {
  if (depth > kMaximumDepth) return fail(Failure::tooDeep, "Containers nested too deep");
  if (tag.kind == Tag::Kind::empty) return Array();
  const std::size_t first = values_.size();
  for (;;) {
    const Tag next = scanner_.readTag();
    if (next.kind == Tag::Kind::close && next.element == Element::array) break;
    if (!scanner_.failed()) values_.push_back(readValue(next, depth));
    if (scanner_.failed()) return {};
  }
  const auto begin = values_.begin() + static_cast<std::ptrdiff_t>(first);
  Array elements(std::make_move_iterator(begin), std::make_move_iterator(values_.end()));
  values_.resize(first);
  return elements;
}

Value XMLReader::readDictionary(const Tag& tag, int depth) {
  if (depth > kMaximumDepth) return fail(Failure::tooDeep, "Containers nested too deep");
  if (tag.kind == Tag::Kind::empty) return Dictionary();
  auto& holder = levels_[static_cast<std::size_t>(depth)];
  if (holder == nullptr) holder = std::make_unique<Level>();
  Level& level = *holder;
  const std::size_t firstKey = keys_.size();
  const std::size_t firstValue = values_.size();
  std::size_t matched = 0;
  for (;;) {
    const Tag next = scanner_.readTag();
    if (scanner_.failed()) return {};
    if (next.kind == Tag::Kind::close && next.element == Element::dict) break;
    if (!readEntry(next, level, matched, firstKey, depth)) return {};
  }
  return finishDictionary(level, matched, firstKey, firstValue);
}

/// `matched` counts the leading keys that equal the level's. After the first different key, all keys are in `keys_`.
bool XMLReader::readEntry(const Tag& tag, Level& level, std::size_t& matched, std::size_t firstKey, int depth) {
  if (tag.element != Element::key || tag.kind == Tag::Kind::close) {
    scanner_.fail(Failure::malformed, "No key before a value in a dictionary");
    return false;
  }
  const std::string_view key = scanner_.readCharacters(tag);
  const bool isAsExpected =
      keys_.size() == firstKey && matched < level.keys.size() && Internals::text(level.keys[matched]) == key;
  if (isAsExpected) {
    ++matched;
  } else {
    materializeKeys(level, matched, firstKey);
    keys_.emplace_back(key);
  }
  const Tag next = scanner_.readTag();
  if (scanner_.failed()) return false;
  values_.push_back(readValue(next, depth));
  return !scanner_.failed();
}

/// Copies the matched keys into `keys_`, unless it already has keys of this dictionary.
void XMLReader::materializeKeys(const Level& level, std::size_t matched, std::size_t firstKey) {
  if (keys_.size() != firstKey) return;
  keys_.insert(keys_.end(), level.keys.begin(), level.keys.begin() + static_cast<std::ptrdiff_t>(matched));
}

Value XMLReader::finishDictionary(Level& level, std::size_t matched, std::size_t firstKey, std::size_t firstValue) {
  const std::span<Value> values = std::span(values_).subspan(firstValue);
  if (values.empty()) return Dictionary();
  Dictionary dictionary;
  if (keys_.size() == firstKey && matched == level.keys.size()) {
    dictionary = makeDictionary(level.pool, level.places, values);
  } else {
    materializeKeys(level, matched, firstKey);
    const std::span<Value> keys = std::span(keys_).subspan(firstKey);
    dictionary = makeDictionary(keys, values);
    if (dictionary.size() == keys.size()) {
      level.pool = DictionaryPool(*Internals::payload(dictionary)->shape);
      level.places = placesOf(keys, *level.pool);
      level.keys.assign(std::make_move_iterator(keys.begin()), std::make_move_iterator(keys.end()));
    }
    keys_.resize(firstKey);
  }
  values_.resize(firstValue);
  return dictionary;
}

}  // namespace

Result<Value> readXML(ByteView document) {
  std::string converted;
  const auto text = decodeText(document, converted);
  if (!text) return text.error();
  return XMLReader(*text).read();
}

}  // namespace appsync::plist
