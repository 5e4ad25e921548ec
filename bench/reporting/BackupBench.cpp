// What making apps ready for a backup costs when there are many: the time must grow with their number and no faster.
#include <string>

#include <benchmark/benchmark.h>

#include "core/AppsClient.h"
#include "tests/support/FakePlatform.h"
#include "tests/support/TodoList.h"

namespace appsync::bench {
namespace {

constexpr int kFew = 1'000;
constexpr int kMany = 10'000;

/// Every second app's file has to be rewritten, each time anew.
void prepareForBackup(benchmark::State& state) {
  test::FakePlatform platform;
  for (std::int64_t number = 0; number < state.range(0); ++number) {
    const test::FakeApp app = test::FakeApp::installed("com.example.app" + std::to_string(number));
    plist::Dictionary metadata{{"title", app.identifier}, {"bundleVersion", "1.2.3"}, {"itemId", number}};
    if (number % 2 == 0) metadata.set("DeviceBasedKLP", false);
    test::putPropertyList(platform.files, *app.containerPath + "/HarvoMetadata.plist", metadata);
    platform.registry.add(app);
  }
  for (const LogLevel level : {LogLevel::standard, LogLevel::error})
    platform.log.disable(8, level);
  const auto client = AppsClient::create(platform);
  for (auto _ : state) {
    client->prepareForBackup();
    state.PauseTiming();
    platform.journal.clear();
    state.ResumeTiming();
  }
}
BENCHMARK(prepareForBackup)->Arg(kFew)->Arg(kMany)->Unit(benchmark::kMillisecond);

}  // namespace
}  // namespace appsync::bench
