// Numbers as the XML form writes them.
#pragma once

#include <string_view>

#include "plist/Value.h"

namespace appsync::plist {

enum class NumberOutcome { parsed, malformed, outOfRange };

/// Without the white space at both ends.
[[nodiscard]] std::string_view trimmed(std::string_view text) noexcept;

/// Decimal, or hexadecimal after 0x, with an optional sign; anything a signed or an unsigned 64-bit integer holds.
[[nodiscard]] NumberOutcome parseInteger(std::string_view text, Value& number) noexcept;

/// Decimal with an optional exponent, "nan", "inf" or "infinity", with an optional sign. What is too small becomes
/// zero.
[[nodiscard]] NumberOutcome parseReal(std::string_view text, double& number) noexcept;

}  // namespace appsync::plist
