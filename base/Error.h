// The one error value, and the result that carries it.
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

/// Why something failed. A value: copies share nothing that changes, and any thread may read one.
///
/// `domain` says whose numbering `code` belongs to; both keep their meaning however far the error climbs.
/// `text` is for people. `underlying` is the error that led to this one, if any.
struct Error {
  std::string domain;
  long code = 0;
  std::string text;
  std::shared_ptr<const Error> underlying;

  /// The same domain and code, with "context: " before the text: what a caller adds on the way up.
  [[nodiscard]] Error in(std::string_view context) const;

  /// A system call's failure: POSIX domain, `number` as its errno, "context: " and the system's own words.
  [[nodiscard]] static Error fromErrno(int number, std::string_view context = {});

  /// Equal domain, code and text; underlying errors are not compared.
  bool operator==(const Error& other) const noexcept {
    return code == other.code && domain == other.domain && text == other.text;
  }
};

/// Appends `Domain code "text"`, then the underlying error in braces, to `out`.
void appendDescription(std::string& out, const Error& error);

/// An out-parameter for an error. May be null: the caller does not want to know.
/// Operations that take one set it on failure only, unless they say otherwise.
using ErrorSlot = std::optional<Error>*;

inline void setError(ErrorSlot slot, Error error) {
  if (slot != nullptr) *slot = std::move(error);
}

/// A value, or the error that stands in its place.
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
  /// None on success.
  [[nodiscard]] const std::optional<Error>& failure() const noexcept { return error_; }

  /// For the callers who, by contract, do not care.
  void ignore() const noexcept {}

 private:
  std::optional<Error> error_;
};

}  // namespace appsync
