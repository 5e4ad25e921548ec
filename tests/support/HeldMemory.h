// How much memory a piece of work holds at its peak. Replaces the program's allocator: exactly one source of a program
// may include this.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdlib>
#include <new>

namespace appsync::test::memory {

/// In front of each allocation, as wide as the strictest alignment.
struct alignas(std::max_align_t) Header {
  std::size_t size;
};

/// Of the running thread, in bytes that were asked for: given back on another thread they are not missed here.
inline thread_local std::ptrdiff_t held = 0;
inline thread_local std::ptrdiff_t mostHeld = 0;

/// The most that this thread held during `work` beyond what it held before. The same work gives the same number.
template <class Work>
std::size_t mostHeldDuring(const Work& work) {
  const std::ptrdiff_t before = held;
  mostHeld = before;
  work();
  return static_cast<std::size_t>(mostHeld - before);
}

}  // namespace appsync::test::memory

// Not inlined: where both ends are seen, a compiler takes them for a mismatch.

[[gnu::noinline]] void* operator new(std::size_t size, const std::nothrow_t&) noexcept {
  using namespace appsync::test::memory;
  auto* header = static_cast<Header*>(std::malloc(sizeof(Header) + size));
  if (header == nullptr) return nullptr;
  header->size = size;
  held += static_cast<std::ptrdiff_t>(size);
  mostHeld = std::max(mostHeld, held);
  return header + 1;
}

[[gnu::noinline]] void* operator new(std::size_t size) {
  void* memory = operator new(size, std::nothrow);
  if (memory == nullptr) throw std::bad_alloc();
  return memory;
}

[[gnu::noinline]] void operator delete(void* memory) noexcept {
  using namespace appsync::test::memory;
  if (memory == nullptr) return;
  Header* header = static_cast<Header*>(memory) - 1;
  held -= static_cast<std::ptrdiff_t>(header->size);
  std::free(header);
}

void operator delete(void* memory, std::size_t) noexcept {
  operator delete(memory);
}
