// Runs work on several threads.
#pragma once

#include <cstddef>
#include <functional>

namespace appsync::test {

/// Runs `work(0)` to `work(count - 1)`, each on its own thread, starting at the same time. Blocks until all have ended.
void runOnThreads(std::size_t count, const std::function<void(std::size_t index)>& work);

}  // namespace appsync::test
