// Work on many threads at once.
#pragma once

#include <cstddef>
#include <functional>

namespace appsync::test {

/// Runs `work(0)` to `work(count - 1)`, each on a thread of its own, all starting together; returns when all have
/// ended.
void runOnThreads(std::size_t count, const std::function<void(std::size_t index)>& work);

}  // namespace appsync::test
