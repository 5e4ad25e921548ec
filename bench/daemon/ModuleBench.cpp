// How long it takes to load the plug-in and make its object: at most five milliseconds.
#include <filesystem>
#include <string>

#include <benchmark/benchmark.h>

#include "daemon/ClientModule.h"
#include "kit/fakes/FakePlatform.h"
#include "kit/fakes/TemporaryFolder.h"

namespace {

using namespace appsync;

/// Each time from a copy of the file: a module is loaded but once.
void loadAndMake(benchmark::State& state) {
  const test::TemporaryFolder folder;
  test::FakePlatform platform;
  int copies = 0;
  for (auto _ : state) {
    state.PauseTiming();
    const std::string copy = folder.path(std::to_string(++copies) + ".so");
    std::filesystem::copy_file(*daemon::modulePath(), copy);
    state.ResumeTiming();
    const auto client = daemon::makeClient(platform, copy);
    if (!client) return state.SkipWithError(client.error().text.c_str());
  }
}
BENCHMARK(loadAndMake)->Name("Module/loadAndMake")->Unit(benchmark::kMillisecond)->Iterations(20);

}  // namespace
