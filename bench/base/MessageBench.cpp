// What a message costs. One whose level is off must cost next to nothing: the plug-in logs every step of its work.
#include <atomic>
#include <cstddef>
#include <cstdlib>
#include <new>
#include <optional>
#include <string>
#include <string_view>

#include <benchmark/benchmark.h>

#include "base/Error.h"
#include "base/Log.h"

namespace {

std::atomic<std::size_t> allocations = 0;

}  // namespace

// NOLINTBEGIN(cppcoreguidelines-no-malloc): this is what the others are made of.
// Not inlined: next to the library's own calls a compiler takes malloc and free for the wrong counterparts.
[[gnu::noinline]] void* operator new(std::size_t size) {
  allocations.fetch_add(1, std::memory_order_relaxed);
  if (void* memory = std::malloc(size)) return memory;
  throw std::bad_alloc();
}
[[gnu::noinline]] void operator delete(void* memory) noexcept {
  std::free(memory);
}
[[gnu::noinline]] void operator delete(void* memory, std::size_t) noexcept {
  std::free(memory);
}
// NOLINTEND(cppcoreguidelines-no-malloc)

namespace appsync {
namespace {

class Category final : public LogCategory {
 public:
  explicit Category(bool on) : on_(on) {}
  [[gnu::noinline]] bool isEnabled(LogLevel) const noexcept override { return on_; }
  void write(LogLevel, std::string_view message) override { benchmark::DoNotOptimize(message.data()); }

 private:
  const bool on_;
};

/// A message with the usual kinds of arguments.
void logOne(benchmark::State& state, Category& category) {
  LogCategory* opaque = &category;
  benchmark::DoNotOptimize(opaque);
  const std::string plugIn = "com.corvel.qor.Zephtra.AppSync";
  const std::string identifier = "com.example.application";
  const std::optional<Error> error = Error{"ZTError", 30, "the package never came", nullptr};
  const std::size_t before = allocations;
  for (auto _ : state) {
    log(*opaque, LogLevel::standard,
        "%s|transfer for asset %{public}@ ended with success %c error %{public}@ existingApp:%d", plugIn, identifier,
        false, error, true);
  }
  state.counters["allocations"] = static_cast<double>(allocations - before) / static_cast<double>(state.iterations());
}

void messageWhoseLevelIsOff(benchmark::State& state) {
  Category category(false);
  logOne(state, category);
  state.counters["required_ns"] = 5;
  if (state.counters["allocations"] > 0) state.SkipWithError("a message whose level is off must not allocate");
}
BENCHMARK(messageWhoseLevelIsOff);

void messageWhoseLevelIsOn(benchmark::State& state) {
  Category category(true);
  logOne(state, category);
}
BENCHMARK(messageWhoseLevelIsOn);

}  // namespace
}  // namespace appsync
