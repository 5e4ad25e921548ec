// Assertions on the errors of operations.
#pragma once

#include <optional>

#include <gtest/gtest.h>

#include "base/Error.h"

namespace appsync::test {

/// Succeeds if `error` has the domain "POSIX" and this error number.
[[nodiscard]] inline testing::AssertionResult failsWith(int number, const std::optional<Error>& error) {
  if (!error) return testing::AssertionFailure() << "must fail with POSIX error " << number << ", but succeeded";
  if (error->domain == domains::kPOSIX && error->code == number) return testing::AssertionSuccess();
  return testing::AssertionFailure() << "must fail with POSIX error " << number << ", but failed with " << error->domain
                                     << " " << error->code << " " << error->text;
}

template <class T>
[[nodiscard]] std::optional<Error> errorOf(const Result<T>& result) {
  if (result) return std::nullopt;
  return result.error();
}

[[nodiscard]] inline std::optional<Error> errorOf(const Status& status) {
  return status.failure();
}

}  // namespace appsync::test
