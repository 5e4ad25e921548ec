// Reads the ASCII format, which people still write by hand.
#include <array>

#include "base/UTF8.h"
#include "plist/internal/Encoding.h"
#include "plist/internal/Failure.h"
#include "plist/internal/Storage.h"

namespace appsync::plist {

namespace {

constexpr std::string_view kSpace = " \t\r\n\v\f";

bool isBareCharacter(char c) noexcept {
  const bool isAlphanumeric = (c >= '0' && c <= '9') || (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z');
  return isAlphanumeric || std::string_view("_$/:.-+").find(c) != std::string_view::npos;
}

int digitOf(char c) noexcept {
  if (c >= '0' && c <= '9') return c - '0';
  if (c >= 'a' && c <= 'f') return c - 'a' + 10;
  if (c >= 'A' && c <= 'F') return c - 'A' + 10;
  return -1;
}

class ASCIIReader {
 public:
  explicit ASCIIReader(std::string_view text) noexcept : text_(text) {}

  Result<Value> read() {
    Value root = readRoot();
    skipSpace();
    if (at_ != text_.size()) fail(Failure::malformed, "Something after the document's end");
    if (failure_) return *std::move(failure_);
    return root;
  }

 private:
  Value fail(Failure kind, std::string_view what) {
    if (!failure_) failure_ = failureAt(kind, what, at_);
    at_ = text_.size();
    return {};
  }

  Value readRoot();
  Value readValue(int depth);
  Value readArray(int depth);
  Value readDictionary(int depth);
  /// Reads `key = value;` repeatedly, until something else follows.
  Dictionary readEntries(int depth);
  Value readData();
  std::string readString();
  std::string readBare();
  std::string readQuoted();
  void appendEscape(std::string& out);
  char32_t readDigits(int base, std::size_t most);
  void appendUnicodeEscape(std::string& out);

  void skipSpace();
  bool take(char c) {
    skipSpace();
    if (at_ == text_.size() || text_[at_] != c) return false;
    ++at_;
    return true;
  }
  [[nodiscard]] bool atEnd() const noexcept { return at_ == text_.size(); }
  [[nodiscard]] std::string_view rest() const noexcept { return text_.substr(at_); }
  [[nodiscard]] bool isStringNext() const noexcept {
    return !atEnd() && (text_[at_] == '"' || text_[at_] == '\'' || isBareCharacter(text_[at_]));
  }

  std::string_view text_;
  std::size_t at_ = 0;
  std::optional<Error> failure_;
};

void ASCIIReader::skipSpace() {
  while (!atEnd()) {
    if (kSpace.find(text_[at_]) != std::string_view::npos) {
      ++at_;
    } else if (rest().starts_with("//")) {
      at_ = std::min(text_.find_first_of("\r\n", at_), text_.size());
    } else if (rest().starts_with("/*")) {
      const std::size_t close = text_.find("*/", at_ + 2);
      if (close == std::string_view::npos) {
        fail(Failure::truncated, "A comment without an end");
        return;
      }
      at_ = close + 2;
    } else {
      return;
    }
  }
}

Value ASCIIReader::readRoot() {
  skipSpace();
  if (!isStringNext()) return readValue(0);
  const std::size_t start = at_;
  std::string word = readString();
  skipSpace();
  if (atEnd()) return word;
  at_ = start;
  return readEntries(1);
}

Value ASCIIReader::readValue(int depth) {
  if (take('{')) return readDictionary(depth + 1);
  if (take('(')) return readArray(depth + 1);
  if (take('<')) return readData();
  if (isStringNext()) return readString();
  return atEnd() ? fail(Failure::truncated, "The document ends too early")
                 : fail(Failure::malformed, "An unexpected character in place of a value");
}

Value ASCIIReader::readArray(int depth) {
  if (depth > kMaximumDepth) return fail(Failure::tooDeep, "Containers nested too deep");
  Array elements;
  while (!take(')')) {
    elements.push_back(readValue(depth));
    if (failure_) return {};
    if (take(',')) continue;
    if (take(')')) break;
    return fail(atEnd() ? Failure::truncated : Failure::malformed, "No comma or end after an element");
  }
  return elements;
}

Value ASCIIReader::readDictionary(int depth) {
  if (depth > kMaximumDepth) return fail(Failure::tooDeep, "Containers nested too deep");
  Dictionary entries = readEntries(depth);
  if (!take('}')) return fail(atEnd() ? Failure::truncated : Failure::malformed, "No end of a dictionary");
  return entries;
}

Dictionary ASCIIReader::readEntries(int depth) {
  std::vector<Value> keys;
  std::vector<Value> values;
  for (skipSpace(); isStringNext(); skipSpace()) {
    keys.emplace_back(readString());
    // A key without a value is its own value.
    values.push_back(take('=') ? readValue(depth) : keys.back());
    if (failure_) return {};
    if (take(';')) continue;
    const bool isLast = !atEnd() && text_[at_] == '}';
    if (!isLast) fail(atEnd() ? Failure::truncated : Failure::malformed, "No semicolon after an entry");
    break;
  }
  return makeDictionary(keys, values);
}

Value ASCIIReader::readData() {
  Bytes bytes;
  while (!take('>')) {
    const int high = atEnd() ? -1 : digitOf(text_[at_]);
    const int low = at_ + 1 < text_.size() ? digitOf(text_[at_ + 1]) : -1;
    if (high < 0 || low < 0) {
      return fail(atEnd() ? Failure::truncated : Failure::malformed, "Data that is not a pair of digits");
    }
    bytes.push_back(static_cast<std::byte>(high << 4 | low));
    at_ += 2;
  }
  return bytes;
}

std::string ASCIIReader::readString() {
  return text_[at_] == '"' || text_[at_] == '\'' ? readQuoted() : readBare();
}

std::string ASCIIReader::readBare() {
  const std::size_t start = at_;
  while (!atEnd() && isBareCharacter(text_[at_]))
    ++at_;
  return std::string(text_.substr(start, at_ - start));
}

std::string ASCIIReader::readQuoted() {
  const std::array<char, 2> stops = {text_[at_++], '\\'};
  std::string out;
  for (;;) {
    const std::size_t stop = text_.find_first_of(std::string_view(stops.data(), stops.size()), at_);
    if (stop == std::string_view::npos) {
      fail(Failure::truncated, "A string without an end");
      return {};
    }
    out += text_.substr(at_, stop - at_);
    at_ = stop + 1;
    if (text_[stop] != '\\') return out;
    appendEscape(out);
    if (failure_) return {};
  }
}

void ASCIIReader::appendEscape(std::string& out) {
  constexpr std::string_view kLetters = "abfnrtv";
  constexpr std::string_view kMeanings = "\a\b\f\n\r\t\v";
  if (atEnd()) {
    fail(Failure::truncated, "An escape without an end");
    return;
  }
  const char c = text_[at_];
  if (c == 'U' || c == 'u') return appendUnicodeEscape(out);
  if (digitOf(c) >= 0 && digitOf(c) < 8) return appendCharacter(out, readDigits(8, 3) & 0xFF);
  const std::size_t letter = kLetters.find(c);
  out += letter == std::string_view::npos ? c : kMeanings[letter];
  ++at_;
}

char32_t ASCIIReader::readDigits(int base, std::size_t most) {
  char32_t number = 0;
  for (; most > 0 && !atEnd(); --most, ++at_) {
    const int digit = digitOf(text_[at_]);
    if (digit < 0 || digit >= base) break;
    number = number * static_cast<char32_t>(base) + static_cast<char32_t>(digit);
  }
  return number;
}

/// Decodes `\U` and up to four digits: a UTF-16 unit. Characters beyond the first plane take two of these.
void ASCIIReader::appendUnicodeEscape(std::string& out) {
  ++at_;
  char32_t c = readDigits(16, 4);
  if (isHighSurrogate(c) && (rest().starts_with("\\U") || rest().starts_with("\\u"))) {
    at_ += 2;
    const char32_t low = readDigits(16, 4);
    if (isLowSurrogate(low)) c = joinSurrogates(c, low);
  }
  if (isSurrogate(c)) {
    fail(Failure::badText, "A lone surrogate before");
  } else {
    appendCharacter(out, c);
  }
}

}  // namespace

Result<Value> readText(ByteView document) {
  std::string converted;
  const auto text = decodeText(document, converted);
  if (!text) return text.error();
  return ASCIIReader(*text).read();
}

}  // namespace appsync::plist
