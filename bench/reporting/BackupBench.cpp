// What making apps ready for a backup costs when there are many: the time must grow with their number and no faster.
#include <benchmark/benchmark.h>

#include "core/AppsClient.h"
#include "kit/fakes/SyncFileBuilder.h"
#include "tests/support/ManyApps.h"

namespace appsync::bench {
namespace {

constexpr int kFew = 1'000;
constexpr int kMany = 10'000;

/// Every app's metadata, which has to be rewritten each time anew.
Bytes metadata() {
  return test::xmlForm(
      plist::Dictionary{{"DeviceBasedKLP", false}, {"bundleVersion", "1.2.3"}, {"itemId", 42}, {"title", "An App"}});
}

void prepareForBackup(benchmark::State& state) {
  test::DeviceOfManyApps device(state.range(0), metadata());
  const auto client = AppsClient::create(device.platform);
  for (auto _ : state) {
    device.files.writes = 0;
    client->prepareForBackup();
    if (device.files.writes != state.range(0)) return state.SkipWithError("not every file was rewritten");
  }
}
BENCHMARK(prepareForBackup)->Arg(kFew)->Arg(kMany)->Unit(benchmark::kMillisecond);

}  // namespace
}  // namespace appsync::bench
