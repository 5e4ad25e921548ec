#include "tests/module/HeapInUse.h"

#include <atomic>
#include <cstdlib>
#include <new>

#include <malloc.h>

namespace {

std::atomic<std::size_t> inUse{0};

void giveBack(void* memory) noexcept {
  inUse -= ::malloc_usable_size(memory);
  std::free(memory);
}

}  // namespace

[[gnu::noinline]] void* operator new(std::size_t size) {
  void* memory = std::malloc(size);
  if (memory == nullptr) throw std::bad_alloc();
  inUse += ::malloc_usable_size(memory);
  return memory;
}
[[gnu::noinline]] void operator delete(void* memory) noexcept {
  giveBack(memory);
}
[[gnu::noinline]] void operator delete(void* memory, std::size_t) noexcept {
  giveBack(memory);
}

namespace appsync::test {

std::size_t heapInUse() {
  return inUse;
}

}  // namespace appsync::test
