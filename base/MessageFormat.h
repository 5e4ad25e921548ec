// The compile-time check of message formats.
#pragma once

#include <array>
#include <concepts>
#include <cstddef>
#include <string>
#include <string_view>
#include <type_traits>

#include "base/Describe.h"

namespace appsync {

namespace detail {

enum class ConversionKind { text, signedInteger, unsignedInteger, real, character, description, percentSign };

struct Conversion {
  std::string_view spelling;  ///< The characters after the '%'.
  ConversionKind kind;
  std::size_t size = 0;  ///< Of numbers: the size of the widest argument in bytes.
};

/// No spelling is a prefix of another.
inline constexpr std::array kConversions{
    Conversion{"s", ConversionKind::text},
    Conversion{"d", ConversionKind::signedInteger, sizeof(int)},
    // As wide as long is on any platform, so that a format compiles on all platforms or on none.
    Conversion{"ld", ConversionKind::signedInteger, sizeof(long long)},
    Conversion{"lld", ConversionKind::signedInteger, sizeof(long long)},
    Conversion{"u", ConversionKind::unsignedInteger, sizeof(unsigned)},
    Conversion{"lu", ConversionKind::unsignedInteger, sizeof(unsigned long long)},
    Conversion{"llu", ConversionKind::unsignedInteger, sizeof(unsigned long long)},
    Conversion{"f", ConversionKind::real, sizeof(double)},
    Conversion{"lf", ConversionKind::real, sizeof(double)},
    Conversion{"c", ConversionKind::character},
    Conversion{"{public}@", ConversionKind::description},
    Conversion{"@", ConversionKind::description},
    Conversion{"%", ConversionKind::percentSign},
};

template <class T>
constexpr bool accepts(const Conversion& conversion) {
  switch (conversion.kind) {
    case ConversionKind::text:
      return Text<T>;
    case ConversionKind::signedInteger:
      return (std::same_as<T, bool> || (Integer<T> && std::is_signed_v<T>)) && sizeof(T) <= conversion.size;
    case ConversionKind::unsignedInteger:
      return Integer<T> && std::is_unsigned_v<T> && sizeof(T) <= conversion.size;
    case ConversionKind::real:
      return std::floating_point<T> && sizeof(T) <= conversion.size;
    case ConversionKind::character:
      return OneOf<T, char, bool>;
    case ConversionKind::description:
      return Describable<T>;
    case ConversionKind::percentSign:
      break;
  }
  return false;
}

// A wrong format does not compile: the check calls one of these, none of which is constexpr, and the compiler names it.
void theFormatHasAnUnknownConversion();
void theFormatHasMoreConversionsThanArguments();
void theFormatHasFewerConversionsThanArguments();
void anArgumentDoesNotSuitItsConversion();

template <class... Args>
consteval void checkFormat(std::string_view text) {
  const std::array<bool (*)(const Conversion&), sizeof...(Args)> acceptors{&accepts<Args>...};
  std::size_t used = 0;
  for (std::size_t at = text.find('%'); at != text.npos; at = text.find('%', at)) {
    text.remove_prefix(at + 1);
    at = 0;
    const Conversion* conversion = nullptr;
    for (const Conversion& candidate : kConversions) {
      if (text.starts_with(candidate.spelling)) conversion = &candidate;
    }
    if (conversion == nullptr) return theFormatHasAnUnknownConversion();
    text.remove_prefix(conversion->spelling.size());
    if (conversion->kind == ConversionKind::percentSign) continue;
    if (used == sizeof...(Args)) return theFormatHasMoreConversionsThanArguments();
    if (!acceptors[used++](*conversion)) return anArgumentDoesNotSuitItsConversion();
  }
  if (used != sizeof...(Args)) theFormatHasFewerConversionsThanArguments();
}

/// Appends the text before the next conversion, moves `text` behind that conversion and returns its last letter, or 0
/// at the end of the text. `text` must have passed checkFormat.
char appendUpToConversion(std::string& out, const char*& text);

/// Appends `value` with six digits after the point.
void appendFixed(std::string& out, double value);

/// Escapes characters that are unsafe for display (see isUnsafeForDisplay) and bytes that are not UTF-8 in the text of
/// `out` from `start` on: a newline as `\n`, others as `\x` and two hexadecimal digits for each byte. Other text,
/// backslashes included, is not changed.
void escapeFrom(std::string& out, std::size_t start);

template <class T>
void appendArgument(std::string& out, [[maybe_unused]] char letter, const T& value) {
  if constexpr (std::same_as<T, bool>) {
    out += letter == 'c' ? (value ? 'y' : 'n') : (value ? '1' : '0');
  } else if constexpr (std::floating_point<T>) {
    letter == 'f' ? appendFixed(out, static_cast<double>(value)) : describe(out, value);
  } else {
    describe(out, value);
  }
}

}  // namespace detail

/// A message format, checked at compile time against the argument types `Args`:
///
///     %s                text
///     %d %ld %lld       a signed integer no wider than the conversion's type; a truth value, as 1 or 0
///     %u %lu %llu       an unsigned integer no wider than the conversion's type
///     %f %lf            a real number, with six digits after the point
///     %c                a character; a truth value, as y or n
///     %{public}@ %@     anything Describable
///     %%                a percent sign
///
/// Any other conversion, a wrong number of arguments and a wrong type do not compile.
template <class... Args>
class MessageFormat {
 public:
  consteval MessageFormat(const char* text) : text_(text) { detail::checkFormat<Args...>(text); }

  constexpr const char* text() const noexcept { return text_; }

 private:
  const char* text_;
};

}  // namespace appsync
