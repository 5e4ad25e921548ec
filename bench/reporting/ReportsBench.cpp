// What questions about all installed apps cost when there are many: the time must grow with their number and no faster,
// and memory not at all.
#include <cstddef>
#include <cstdint>
#include <string>

#include <benchmark/benchmark.h>

#include "core/AppsClient.h"
#include "kit/fakes/SyncFileBuilder.h"
#include "tests/support/HeldMemory.h"
#include "tests/support/ManyApps.h"

namespace appsync::bench {
namespace {

constexpr int kFew = 1'000;
constexpr int kMany = 10'000;

/// Metadata as stores write it, of the one account that owns everything.
Bytes metadata() {
  const plist::Dictionary account{{"CorvelID", "ada@example.org"}, {"DSPersonID", 1815}, {"AltDSID", "000815-10-1815"}};
  return test::binaryForm(
      plist::Dictionary{{"corvelId", "ada@example.org"},
                        {"com.corvel.HarvoStore.downloadInfo", plist::Dictionary{{"accountInfo", account}}},
                        {"bundleVersion", "1.2.3"},
                        {"copyright", std::string(200, 'c')},
                        {"itemId", 42},
                        {"itemName", "An App"},
                        {"title", "An App: And What It Does"}});
}

/// Enough for one app's record and metadata, and for no second one's.
std::size_t allowedMemory(const test::SameFileEverywhere& files) {
  constexpr std::size_t kRecordAndValues = 4'000;
  return files.size() + kRecordAndValues;
}

template <class Operation>
void measure(benchmark::State& state, std::int64_t readsPerApp, const Operation& operation) {
  test::DeviceOfManyApps device(state.range(0), metadata());
  const auto client = AppsClient::create(device.platform);
  std::size_t most = 0;
  for (auto _ : state) {
    device.files.reads = 0;
    most = test::memory::mostHeldDuring([&] { operation(*client, state.range(0)); });
    if (device.files.reads != readsPerApp * state.range(0)) return state.SkipWithError("not every file was read once");
    if (most > allowedMemory(device.files)) return state.SkipWithError("it took too much memory");
  }
  state.counters["memory"] = static_cast<double>(most);
}

void installedAssetMetrics(benchmark::State& state) {
  measure(state, 0, [&](AppsClient& client, std::int64_t count) {
    const plist::Dictionary metrics = client.installedAssetMetrics();
    if (*metrics.find(platform::kMetricCount) != plist::Value(count)) state.SkipWithError("not every app was counted");
  });
}
BENCHMARK(installedAssetMetrics)->Arg(kFew)->Arg(kMany)->Unit(benchmark::kMillisecond);

void corvelIDsForAssets(benchmark::State& state) {
  measure(state, 1, [&](AppsClient& client, std::int64_t) {
    if (client.corvelIDsForAssets().size() != 1) state.SkipWithError("not one identifier");
  });
}
BENCHMARK(corvelIDsForAssets)->Arg(kFew)->Arg(kMany)->Unit(benchmark::kMillisecond);

void accountsForAssets(benchmark::State& state) {
  measure(state, 1, [&](AppsClient& client, std::int64_t) {
    if (client.accountsForAssets().size() != 1) state.SkipWithError("not one account");
  });
}
BENCHMARK(accountsForAssets)->Arg(kFew)->Arg(kMany)->Unit(benchmark::kMillisecond);

}  // namespace
}  // namespace appsync::bench
