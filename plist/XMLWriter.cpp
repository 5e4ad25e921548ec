// Writes the XML format: one element per line, indented by tabs.
#include <array>
#include <charconv>
#include <cmath>

#include "base/UTF8.h"
#include "plist/internal/Base64.h"
#include "plist/internal/Date.h"
#include "plist/internal/Encoding.h"
#include "plist/internal/Failure.h"
#include "plist/internal/Storage.h"

namespace appsync::plist {

namespace {

constexpr std::string_view kHead = "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<plist version=\"1.0\">\n";
constexpr std::string_view kTail = "</plist>\n";
/// Bytes in a line of data: 76 characters of Base64.
constexpr std::size_t kDataLine = 57;

constexpr std::size_t kDeepest = static_cast<std::size_t>(kMaximumDepth);

/// An output buffer that is written through a pointer into reserved space.
class Output {
 public:
  explicit Output(std::size_t expected) : bytes_(expected) {}

  /// Reserves space for `size` more characters; `advanceTo` sets how many were written.
  [[nodiscard]] char* reserve(std::size_t size) {
    if (size > bytes_.size() - used_) bytes_.resize((bytes_.size() + size) * 2);
    return reinterpret_cast<char*>(bytes_.data()) + used_;
  }
  void advanceTo(const char* end) noexcept {
    used_ = static_cast<std::size_t>(end - reinterpret_cast<const char*>(bytes_.data()));
  }
  void append(std::string_view text) {
    std::memcpy(reserve(text.size()), text.data(), text.size());
    used_ += text.size();
  }
  [[nodiscard]] Bytes take() {
    bytes_.resize(used_);
    return std::move(bytes_);
  }

 private:
  Bytes bytes_;
  std::size_t used_ = 0;
};

/// How a byte of text is written.
enum class Treatment : std::uint8_t { plain, escaped, sequence, forbidden };

constexpr auto kTreatments = [] {
  std::array<Treatment, 256> treatments{};
  for (std::size_t i = 0; i < 0x20; ++i)
    treatments[i] = Treatment::forbidden;
  treatments['\t'] = treatments['\n'] = Treatment::plain;
  treatments['\r'] = treatments['<'] = treatments['>'] = treatments['&'] = Treatment::escaped;
  for (std::size_t i = 0x80; i < 0x100; ++i)
    treatments[i] = Treatment::sequence;
  return treatments;
}();

constexpr std::string_view escapeOf(char c) noexcept {
  switch (c) {
    case '<':
      return "&lt;";
    case '>':
      return "&gt;";
    case '&':
      return "&amp;";
    default:
      return "&#13;";
  }
}

/// Exact except for escapes and numbers, so that the buffer is rarely reallocated.
void addExpandedSize(const Value& value, std::size_t depth, std::size_t& size) {
  constexpr std::size_t kTags = 40;
  size += 2 * depth + kTags;
  if (depth > kDeepest || size > kMaximumExpandedSize) return;
  if (const auto text = value.string()) {
    size += text->size();
  } else if (const auto data = value.data()) {
    size += base64Length(data->size()) + (data->size() / kDataLine + 1) * (depth + 1);
  } else if (const Array* array = value.array()) {
    for (const Value& element : *array)
      addExpandedSize(element, depth + 1, size);
  } else if (const Dictionary* dictionary = value.dictionary()) {
    for (const auto& [key, entry] : *dictionary) {
      size += depth + key.size() + 16;
      addExpandedSize(entry, depth + 1, size);
    }
  }
}

class XMLWriter {
 public:
  Result<Bytes> write(const Value& root) {
    const std::size_t expected = kHead.size() + kTail.size() + expandedSize(root);
    if (expected > kMaximumExpandedSize) return failure(Failure::tooLarge, "Too many values for one property list");
    Output out(expected);
    out_ = &out;
    out.append(kHead);
    writeValue(root, 0);
    out.append(kTail);
    if (failure_) return *std::move(failure_);
    return out.take();
  }

 private:
  void fail(Failure kind, std::string_view what) {
    if (!failure_) failure_ = failure(kind, what);
  }

  void writeValue(const Value& value, std::size_t depth);
  void writeInteger(const Value& value, std::size_t depth);
  void writeReal(double number, std::size_t depth);
  void writeDate(Date date, std::size_t depth);
  void writeData(ByteView data, std::size_t depth);
  void writeText(std::string_view open, std::string_view text, std::string_view close, std::size_t depth);
  void writeCharacters(std::string_view text);
  std::size_t writeSequence(std::string_view text);
  void writeArray(const Array& array, std::size_t depth);
  void writeDictionary(const Dictionary& dictionary, std::size_t depth);
  void indent(std::size_t depth) {
    char* at = out_->reserve(depth);
    std::memset(at, '\t', depth);
    out_->advanceTo(at + depth);
  }
  void writeLine(std::string_view line, std::size_t depth) {
    indent(depth);
    out_->append(line);
  }

  Output* out_ = nullptr;
  std::optional<Error> failure_;
};

void XMLWriter::writeValue(const Value& value, std::size_t depth) {
  switch (value.type()) {
    case Type::null:
      return fail(Failure::notRepresentable, "A property list cannot hold a null");
    case Type::boolean:
      return writeLine(*value.boolean() ? "<true/>\n" : "<false/>\n", depth);
    case Type::integer:
      return writeInteger(value, depth);
    case Type::real:
      return writeReal(*value.number(), depth);
    case Type::string:
      return writeText("<string>", *value.string(), "</string>\n", depth);
    case Type::data:
      return writeData(*value.data(), depth);
    case Type::date:
      return writeDate(*value.date(), depth);
    case Type::uid:
      return fail(Failure::notRepresentable, "The XML format has no uid");
    case Type::array:
      return writeArray(*value.array(), depth);
    case Type::dictionary:
      return writeDictionary(*value.dictionary(), depth);
  }
}

void XMLWriter::writeInteger(const Value& value, std::size_t depth) {
  std::array<char, 24> digits;
  const auto number = value.int64();
  const char* end = number ? std::to_chars(digits.begin(), digits.end(), *number).ptr
                           : std::to_chars(digits.begin(), digits.end(), *value.uint64()).ptr;
  writeLine("<integer>", depth);
  out_->append({digits.begin(), end});
  out_->append("</integer>\n");
}

void XMLWriter::writeReal(double number, std::size_t depth) {
  std::array<char, 32> digits;
  const char* end = std::to_chars(digits.begin(), digits.end(), std::isnan(number) ? std::fabs(number) : number).ptr;
  writeLine("<real>", depth);
  out_->append({digits.begin(), end});
  out_->append("</real>\n");
}

void XMLWriter::writeDate(Date date, std::size_t depth) {
  if (!isInCalendar(date)) return fail(Failure::notRepresentable, "A date outside the calendar");
  std::string text;
  appendDate(text, date);
  writeLine("<date>", depth);
  out_->append(text);
  out_->append("</date>\n");
}

void XMLWriter::writeData(ByteView data, std::size_t depth) {
  writeLine("<data>\n", depth);
  while (!data.empty()) {
    const ByteView line = data.first(std::min(data.size(), kDataLine));
    data = data.subspan(line.size());
    char* at = out_->reserve(depth + base64Length(line.size()) + 1);
    std::memset(at, '\t', depth);
    at = writeBase64(line, at + depth);
    *at++ = '\n';
    out_->advanceTo(at);
  }
  writeLine("</data>\n", depth);
}

void XMLWriter::writeText(std::string_view open, std::string_view text, std::string_view close, std::size_t depth) {
  writeLine(open, depth);
  writeCharacters(text);
  out_->append(close);
}

void XMLWriter::writeCharacters(std::string_view text) {
  while (!text.empty()) {
    std::size_t plain = 0;
    while (plain < text.size() && kTreatments[static_cast<unsigned char>(text[plain])] == Treatment::plain)
      ++plain;
    out_->append(text.substr(0, plain));
    text.remove_prefix(plain);
    if (text.empty()) return;
    switch (kTreatments[static_cast<unsigned char>(text.front())]) {
      case Treatment::escaped:
        out_->append(escapeOf(text.front()));
        text.remove_prefix(1);
        break;
      case Treatment::sequence:
        text.remove_prefix(writeSequence(text));
        break;
      default:
        return fail(Failure::badText, "A string has a character that XML forbids");
    }
    if (failure_) return;
  }
}

/// Writes one character beyond ASCII and returns its length.
std::size_t XMLWriter::writeSequence(std::string_view text) {
  const std::size_t length = sequenceLength(text);
  if (length == 0) {
    fail(Failure::badText, "A string is not well-formed UTF-8");
  } else if (!isXMLCharacter(decodeSequence(text.data(), length))) {
    fail(Failure::badText, "A string has a character that XML forbids");
  } else {
    out_->append(text.substr(0, length));
  }
  return length;
}

void XMLWriter::writeArray(const Array& array, std::size_t depth) {
  if (depth == kDeepest) return fail(Failure::tooDeep, "Containers are nested too deep");
  if (array.empty()) return writeLine("<array/>\n", depth);
  writeLine("<array>\n", depth);
  for (const Value& element : array) {
    if (failure_) return;
    writeValue(element, depth + 1);
  }
  writeLine("</array>\n", depth);
}

void XMLWriter::writeDictionary(const Dictionary& dictionary, std::size_t depth) {
  if (depth == kDeepest) return fail(Failure::tooDeep, "Containers are nested too deep");
  if (dictionary.empty()) return writeLine("<dict/>\n", depth);
  writeLine("<dict>\n", depth);
  for (const auto& [key, value] : dictionary) {
    if (failure_) return;
    writeText("<key>", key, "</key>\n", depth + 1);
    writeValue(value, depth + 1);
  }
  writeLine("</dict>\n", depth);
}

}  // namespace

std::size_t expandedSize(const Value& value) {
  std::size_t size = 0;
  addExpandedSize(value, 0, size);
  return size;
}

Result<Bytes> writeXML(const Value& root) {
  return XMLWriter().write(root);
}

}  // namespace appsync::plist
