// Passes an error on to the caller.
#pragma once

#include <utility>

/// Evaluates a `Status` or `Result` once and, if it failed, returns its error from the enclosing function, which
/// returns a `Status` or `Result` itself.
#define RETURN_IF_ERROR(...)                                                       \
  do {                                                                             \
    if (auto returnIfErrorOutcome_ = (__VA_ARGS__); !returnIfErrorOutcome_.ok()) { \
      return std::move(returnIfErrorOutcome_).error();                             \
    }                                                                              \
  } while (false)
