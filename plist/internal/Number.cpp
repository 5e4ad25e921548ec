#include "plist/internal/Number.h"

#include <charconv>
#include <cmath>

namespace appsync::plist {

namespace {

constexpr std::string_view kSpace = " \t\r\n";

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

}  // namespace

std::string_view trimmed(std::string_view text) noexcept {
  const std::size_t first = text.find_first_not_of(kSpace);
  if (first == std::string_view::npos) return {};
  return text.substr(first, text.find_last_not_of(kSpace) - first + 1);
}

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

NumberOutcome parseReal(std::string_view text, double& number) noexcept {
  const bool isNegative = takeSign(text);
  if (text.starts_with('-') || text.find('(') != std::string_view::npos) return NumberOutcome::malformed;
  NumberOutcome outcome = parseWhole(text, number);
  if (outcome == NumberOutcome::outOfRange) {
    // Too large or too small for a double: a wider type tells which.
    long double wide = 0;
    outcome = parseWhole(text, wide);
    number = static_cast<double>(wide);
    if (outcome == NumberOutcome::parsed && std::isinf(number)) return NumberOutcome::outOfRange;
  }
  if (isNegative) number = -number;
  return outcome;
}

}  // namespace appsync::plist
