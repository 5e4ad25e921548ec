// What came of an operation, and whether it failed as promised.
#pragma once

#include <optional>

#include <gtest/gtest.h>

#include "base/Error.h"

namespace appsync::test {

/// A failure of the system's own numbering.
[[nodiscard]] inline testing::AssertionResult failsWith(int number, const std::optional<Error>& error) {
  if (!error) return testing::AssertionFailure() << "it succeeded";
  if (error->domain == domains::kPOSIX && error->code == number) return testing::AssertionSuccess();
  return testing::AssertionFailure() << error->domain << " " << error->code << " " << error->text;
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
