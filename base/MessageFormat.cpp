#include "base/MessageFormat.h"

#include <charconv>
#include <cstring>
#include <iterator>
#include <limits>

namespace appsync::detail {

char appendUpToConversion(std::string& out, const char*& text) {
  while (true) {
    const std::size_t literal = std::strcspn(text, "%");
    out.append(text, literal);
    text += literal;
    if (*text == '\0') return '\0';
    ++text;
    if (*text == '{') text = std::strchr(text, '@');
    while (*text == 'l')
      ++text;
    const char letter = *text++;
    if (letter != '%') return letter;
    out += letter;
  }
}

void appendFixed(std::string& out, double value) {
  constexpr int kDigits = 6;
  constexpr std::size_t kLongest = std::numeric_limits<double>::max_exponent10 + kDigits + sizeof "-0.";
  char digits[kLongest];
  const auto end = std::to_chars(digits, std::end(digits), value, std::chars_format::fixed, kDigits);
  out.append(digits, end.ptr);
}

}  // namespace appsync::detail
