// Descriptions of values for logs.
#include <array>
#include <charconv>

#include "plist/PropertyList.h"
#include "plist/internal/Date.h"

namespace appsync::plist {

namespace {

constexpr std::string_view kCut = "…";
/// Longer data is truncated to this length.
constexpr std::size_t kShownData = 24;
constexpr int kShownDepth = 32;
/// The approximate maximum length of a description.
constexpr std::size_t kLongest = std::size_t{1} << 20;

bool isBareWord(std::string_view text) noexcept {
  constexpr std::string_view kBare = "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789_$/:.-";
  return !text.empty() && text.find_first_not_of(kBare) == std::string_view::npos;
}

void appendString(std::string& out, std::string_view text) {
  if (isBareWord(text)) {
    out += text;
    return;
  }
  out += '"';
  for (const char c : text) {
    if (c == '"' || c == '\\') out += '\\';
    out += c;
  }
  out += '"';
}

template <class T>
void appendNumber(std::string& out, T number) {
  std::array<char, 32> digits;
  out.append(digits.begin(), std::to_chars(digits.begin(), digits.end(), number).ptr);
}

void appendData(std::string& out, ByteView data) {
  constexpr std::string_view kDigits = "0123456789abcdef";
  out += '<';
  for (const std::byte byte : data.first(std::min(data.size(), kShownData))) {
    out += kDigits[std::to_integer<std::size_t>(byte >> 4)];
    out += kDigits[std::to_integer<std::size_t>(byte & std::byte{0xF})];
  }
  if (data.size() > kShownData) {
    out += kCut;
    out += ' ';
    appendNumber(out, data.size());
    out += " bytes";
  }
  out += '>';
}

class Describer {
 public:
  explicit Describer(std::string& out) noexcept : out_(out), limit_(out.size() + kLongest) {}

  void describe(const Value& value, int depth);
  void describe(const Array& array, int depth);

 private:
  void describeScalar(const Value& value);
  void describe(const Dictionary& dictionary, int depth);
  [[nodiscard]] bool isFull() {
    if (out_.size() < limit_) return false;
    out_ += kCut;
    return true;
  }

  std::string& out_;
  std::size_t limit_;
};

void Describer::describe(const Value& value, int depth) {
  const Array* array = value.array();
  const Dictionary* dictionary = value.dictionary();
  if (array == nullptr && dictionary == nullptr) return describeScalar(value);
  if (depth == kShownDepth) {
    out_ += kCut;
  } else if (array != nullptr) {
    describe(*array, depth + 1);
  } else {
    describe(*dictionary, depth + 1);
  }
}

void Describer::describe(const Array& array, int depth) {
  std::string_view separator = "(";
  for (const Value& element : array) {
    out_ += separator;
    if (isFull()) break;
    describe(element, depth);
    separator = ", ";
  }
  out_ += array.empty() ? "()" : ")";
}

void Describer::describe(const Dictionary& dictionary, int depth) {
  std::string_view separator = "{";
  for (const auto& [key, value] : dictionary) {
    out_ += separator;
    if (isFull()) break;
    appendString(out_, key);
    out_ += " = ";
    describe(value, depth);
    separator = "; ";
  }
  out_ += dictionary.empty() ? "{}" : ";}";
}

void Describer::describeScalar(const Value& value) {
  if (const auto text = value.string()) return appendString(out_, *text);
  if (const auto data = value.data()) return appendData(out_, *data);
  if (const auto truth = value.boolean()) {
    out_ += *truth ? "1" : "0";
  } else if (const auto number = value.int64()) {
    appendNumber(out_, *number);
  } else if (const auto large = value.uint64()) {
    appendNumber(out_, *large);
  } else if (const auto real = value.number()) {
    appendNumber(out_, *real);
  } else if (const auto date = value.date()) {
    if (isInCalendar(*date)) return appendDate(out_, *date);
    appendNumber(out_, date->seconds);
  } else if (const auto uid = value.uid()) {
    out_ += "uid ";
    appendNumber(out_, uid->number);
  } else {
    out_ += "(null)";
  }
}

}  // namespace

void appendDescription(std::string& out, const Value& value) {
  if (const auto text = value.string()) {
    out += *text;
  } else {
    Describer(out).describe(value, 0);
  }
}

void appendDescription(std::string& out, const Array& array) {
  Describer(out).describe(array, 1);
}

}  // namespace appsync::plist
