// The error type, and the results that carry it.
#pragma once

#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <variant>

namespace appsync {

namespace domains {
inline constexpr std::string_view kPOSIX = "POSIX";
}

/// Why an operation failed. An immutable value: copies may be used on different threads.
///
/// `domain` is the namespace of `code`; callers that pass an error on keep both. `text` is for people, not for
/// programs. `underlying` is the error that caused this one, or null.
struct Error {
  std::string domain;
  long code = 0;
  std::string text;
  std::shared_ptr<const Error> underlying;

  /// Returns a copy with "context: " before the text.
  [[nodiscard]] Error in(std::string_view context) const;

  /// Returns the error of a failed system call: POSIX domain, errno `number` as the code, and the system's description
  /// after "context: ".
  [[nodiscard]] static Error fromErrno(int number, std::string_view context = {});

  /// Equal domain, code and text; underlying errors are not compared.
  bool operator==(const Error& other) const noexcept {
    return code == other.code && domain == other.domain && text == other.text;
  }
};

/// Appends `Domain code "text"`, then the underlying error in braces, to `out`.
void appendDescription(std::string& out, const Error& error);

/// An out-parameter for an error. May be null if the caller does not need the error.
/// Operations set it on failure only, unless documented otherwise.
using ErrorSlot = std::optional<Error>*;

inline void setError(ErrorSlot slot, Error error) {
  if (slot != nullptr) *slot = std::move(error);
}

/// A value, or the error of the operation that should have returned it.
template <class T>
class [[nodiscard]] Result {
 public:
  Result(T value) : outcome_(std::in_place_index<0>, std::move(value)) {}
  Result(Error error) : outcome_(std::in_place_index<1>, std::move(error)) {}

  [[nodiscard]] bool ok() const noexcept { return outcome_.index() == 0; }
  explicit operator bool() const noexcept { return ok(); }

  /// Only when ok().
  [[nodiscard]] T& value() & { return *std::get_if<0>(&outcome_); }
  [[nodiscard]] const T& value() const& { return *std::get_if<0>(&outcome_); }
  [[nodiscard]] T&& value() && { return std::move(*std::get_if<0>(&outcome_)); }
  T& operator*() & { return value(); }
  const T& operator*() const& { return value(); }
  T* operator->() { return &value(); }
  const T* operator->() const { return &value(); }

  /// Only when not ok().
  [[nodiscard]] const Error& error() const& { return *std::get_if<1>(&outcome_); }
  [[nodiscard]] Error&& error() && { return std::move(*std::get_if<1>(&outcome_)); }

 private:
  std::variant<T, Error> outcome_;
};

/// Success, or the error that prevented it.
class [[nodiscard]] Status {
 public:
  Status() = default;
  Status(Error error) : error_(std::move(error)) {}

  [[nodiscard]] bool ok() const noexcept { return !error_.has_value(); }
  explicit operator bool() const noexcept { return ok(); }

  /// Only when not ok().
  [[nodiscard]] const Error& error() const { return *error_; }
  /// Returns nullopt on success.
  [[nodiscard]] const std::optional<Error>& failure() const noexcept { return error_; }

  /// Discards the result explicitly.
  void ignore() const noexcept {}

 private:
  std::optional<Error> error_;
};

}  // namespace appsync
