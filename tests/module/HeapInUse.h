// How much memory this program holds.
#pragma once

#include <cstddef>

namespace appsync::test {

/// The bytes that were given out by `operator new`, in this program and in what it has loaded, and not given back.
[[nodiscard]] std::size_t heapInUse();

}  // namespace appsync::test
