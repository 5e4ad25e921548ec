#include "kit/fakes/Threads.h"

#include <latch>
#include <thread>
#include <vector>

namespace appsync::test {

void runOnThreads(std::size_t count, const std::function<void(std::size_t index)>& work) {
  std::latch start(static_cast<std::ptrdiff_t>(count));
  std::vector<std::jthread> threads;
  threads.reserve(count);
  for (std::size_t index = 0; index < count; ++index) {
    threads.emplace_back([&, index] {
      start.arrive_and_wait();
      work(index);
    });
  }
}

}  // namespace appsync::test
