// Parallel loops.
#pragma once

#include <algorithm>
#include <atomic>
#include <cstddef>
#include <thread>
#include <vector>

namespace appsync::host {

/// Calls `work` with each index below `count`, on as many threads as the machine has processors, and blocks until all
/// calls have returned. `work` must not throw.
template <class Work>
void inParallel(std::size_t count, const Work& work) {
  std::atomic<std::size_t> next = 0;
  const auto run = [&] {
    for (std::size_t number = next++; number < count; number = next++)
      work(number);
  };
  const std::size_t threads = std::min<std::size_t>(count, std::max(1U, std::thread::hardware_concurrency()));
  std::vector<std::jthread> others;
  for (std::size_t thread = 1; thread < threads; ++thread)
    others.emplace_back(run);
  run();
}

}  // namespace appsync::host
