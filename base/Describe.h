// Descriptions of values for people: what `%{public}@` prints in a message.
#pragma once

#include <concepts>
#include <cstddef>
#include <memory>
#include <optional>
#include <ranges>
#include <string>
#include <string_view>
#include <type_traits>

namespace appsync {

namespace detail {

template <class T, class... Others>
concept OneOf = (std::same_as<T, Others> || ...);

/// A number, not a truth value or a character.
template <class T>
concept Integer = std::integral<T> && !OneOf<T, bool, char, wchar_t, char8_t, char16_t, char32_t>;

/// Strings, views, literals and C strings. A null C string prints "(null)".
template <class T>
concept Text = !std::same_as<T, std::nullptr_t> && std::convertible_to<const T&, std::string_view>;

/// Converts to `const T&` only, so that an overload for a type that T converts to is not taken for T's overload.
template <class T>
struct Exactly {
  operator const T&() const;
};

void appendDescription() = delete;  // Hides every overload but those that argument-dependent lookup finds.

template <class T>
concept DescribedByFunction = requires(std::string& out, const Exactly<T>& value) {
  appendDescription(out, value);
};

template <class T>
concept DescribedByMember = requires(const T& value) {
  { value.description() } -> std::convertible_to<std::string_view>;
};

template <class T>
inline constexpr bool kIsHandle = std::is_pointer_v<T>&& std::is_object_v<std::remove_pointer_t<T>>;
template <class T>
inline constexpr bool kIsHandle<std::optional<T>> = true;
template <class T, class Deleter>
inline constexpr bool kIsHandle<std::unique_ptr<T, Deleter>> = true;
template <class T>
inline constexpr bool kIsHandle<std::shared_ptr<T>> = true;

/// A pointer or optional: refers to one value, or is null.
template <class T>
concept Handle = kIsHandle<T> && requires(const T& handle) {
  *handle;
};

template <class T>
concept Scalar = OneOf<T, bool, char, std::nullopt_t, std::nullptr_t> || Integer<T> || std::floating_point<T>;

/// A range whose elements have the type of the range, such as a file path, is excluded: it would recurse forever.
template <class T>
concept Range = std::ranges::input_range<const T> && !std::same_as<std::ranges::range_value_t<const T>, T>;

template <class T>
using Held = std::remove_cvref_t<decltype(*std::declval<const T&>())>;

template <class T>
consteval bool isDescribable() {
  if constexpr (Scalar<T> || Text<T>) {
    return true;
  } else if constexpr (Handle<T>) {
    return isDescribable<Held<T>>();
  } else if constexpr (DescribedByFunction<T> || DescribedByMember<T>) {
    return true;
  } else if constexpr (Range<T>) {
    return isDescribable<std::ranges::range_value_t<const T>>();
  } else {
    return false;
  }
}

inline constexpr std::string_view kAbsent = "(null)";

void appendSigned(std::string& out, long long value);
void appendUnsigned(std::string& out, unsigned long long value);
/// Appends the shortest text that parses to the same number.
void appendReal(std::string& out, double value);

}  // namespace detail

/// What describe() can print:
/// - text and characters print unchanged; true prints "1" and false "0"; integers print in decimal; a real prints as
///   the shortest text that parses to the same number;
/// - nullopt, nullptr, an empty optional and a null pointer (plain or smart) print "(null)"; other optionals and
///   pointers print the value they refer to;
/// - a type with a function `void appendDescription(std::string& out, const T& value)` in its namespace prints what
///   that appends, a type with a member `description()` prints what that returns;
/// - any other range prints "(first, second)", its elements described by these rules.
template <class T>
concept Describable = detail::isDescribable<T>();

/// Appends the description of `value` to `out`.
template <Describable T>
void describe(std::string& out, const T& value) {
  if constexpr (detail::OneOf<T, std::nullopt_t, std::nullptr_t>) {
    out += detail::kAbsent;
  } else if constexpr (detail::OneOf<T, bool>) {
    out += value ? '1' : '0';
  } else if constexpr (detail::OneOf<T, char>) {
    out += value;
  } else if constexpr (detail::Integer<T> && std::is_signed_v<T>) {
    detail::appendSigned(out, value);
  } else if constexpr (detail::Integer<T>) {
    detail::appendUnsigned(out, value);
  } else if constexpr (std::floating_point<T>) {
    detail::appendReal(out, static_cast<double>(value));
  } else if constexpr (detail::OneOf<T, const char*, char*>) {
    out += value != nullptr ? std::string_view(value) : detail::kAbsent;
  } else if constexpr (detail::Text<T>) {
    out += static_cast<std::string_view>(value);
  } else if constexpr (detail::Handle<T>) {
    if (value) {
      describe(out, *value);
    } else {
      out += detail::kAbsent;
    }
  } else if constexpr (detail::DescribedByFunction<T>) {
    appendDescription(out, value);
  } else if constexpr (detail::DescribedByMember<T>) {
    out += value.description();
  } else {
    out += '(';
    std::string_view separator;
    for (const auto& element : value) {
      out += separator;
      describe(out, element);
      separator = ", ";
    }
    out += ')';
  }
}

/// Returns the description of `value`.
template <Describable T>
[[nodiscard]] std::string description(const T& value) {
  std::string out;
  describe(out, value);
  return out;
}

}  // namespace appsync
