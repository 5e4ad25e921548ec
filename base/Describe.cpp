#include "base/Describe.h"

#include <charconv>
#include <iterator>

namespace appsync::detail {

namespace {

/// Longer than any 64-bit integer and any shortest real.
constexpr std::size_t kLongestNumber = 32;

template <class Number>
void appendNumber(std::string& out, Number value) {
  char digits[kLongestNumber];
  out.append(digits, std::to_chars(digits, std::end(digits), value).ptr);
}

}  // namespace

void appendSigned(std::string& out, long long value) {
  appendNumber(out, value);
}

void appendUnsigned(std::string& out, unsigned long long value) {
  appendNumber(out, value);
}

void appendReal(std::string& out, double value) {
  appendNumber(out, value);
}

}  // namespace appsync::detail
