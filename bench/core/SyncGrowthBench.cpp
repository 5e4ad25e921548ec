// What a sync's questions cost when there are many apps: the time must grow with their number and no faster.
#include <map>
#include <string>
#include <vector>

#include <benchmark/benchmark.h>

#include "core/AppsClient.h"
#include "kit/fakes/FakePlatform.h"
#include "kit/fakes/TodoList.h"

namespace appsync::bench {
namespace {

using test::FakeApp;
using test::FakePlatform;

constexpr int kFew = 1'000;
constexpr int kMany = 10'000;

std::string identifier(std::string_view kind, std::int64_t number) {
  return "com.example." + std::string(kind) + std::to_string(number);
}

/// As many todo entries as placeholders, none of them for the same app; every second icon stands on the home screen.
void prepare(FakePlatform& platform, std::int64_t count) {
  plist::Array entries;
  std::vector<std::string> icons;
  for (std::int64_t number = 0; number < count; ++number) {
    entries.emplace_back(test::installEntry(identifier("wanted", number)));
    platform.registry.add(FakeApp::placeholder(identifier("waiting", number), platform::TSInstallType::Restore));
    if (number % 2 == 0) icons.push_back(identifier("wanted", number));
  }
  platform.files.put(test::kTodoListPath, test::binaryForm(std::move(entries)));
  platform.screen.setFlattenedIconState(icons);
  for (const int category : {8, 14}) {
    platform.log.disable(category, LogLevel::standard);
    platform.log.disable(category, LogLevel::error);
  }
}

void outstandingAssetTransfers(benchmark::State& state) {
  for (auto _ : state) {
    state.PauseTiming();
    auto platform = std::make_unique<FakePlatform>();
    prepare(*platform, state.range(0));
    auto client = AppsClient::create(*platform);
    state.ResumeTiming();
    benchmark::DoNotOptimize(client->outstandingAssetTransfers());
    state.PauseTiming();
    client.reset();
    platform.reset();
    state.ResumeTiming();
  }
}
BENCHMARK(outstandingAssetTransfers)->Arg(kFew)->Arg(kMany)->Unit(benchmark::kMillisecond);

void installedAssets(benchmark::State& state) {
  FakePlatform platform;
  prepare(platform, state.range(0));
  plist::Array lastSync;
  for (std::int64_t number = 0; number < state.range(0); ++number) {
    platform.uninstalledList.add(identifier("removed", number));
    lastSync.emplace_back(identifier(number % 2 == 0 ? "wanted" : "waiting", number));
  }
  test::putPropertyList(platform.files, "/var/mobile/Library/ApplicationSync/LastSyncAppState.plist", lastSync);
  const auto client = AppsClient::create(platform);
  for (auto _ : state) {
    auto deleted = client->installedAssets();
    state.PauseTiming();
    deleted = {};
    platform.journal.clear();
    state.ResumeTiming();
  }
}
BENCHMARK(installedAssets)->Arg(kFew)->Arg(kMany)->Unit(benchmark::kMillisecond);

void orderTheItems(benchmark::State& state) {
  FakePlatform platform;
  prepare(platform, state.range(0));
  std::map<std::string, std::string, std::less<>> items;
  for (std::int64_t number = 0; number < state.range(0); ++number) {
    items.emplace(identifier("wanted", number), "item");
  }
  for (auto _ : state) {
    state.PauseTiming();
    auto remaining = items;
    state.ResumeTiming();
    auto ordered = AppsClient::_orderTheItems(platform, remaining);
    state.PauseTiming();
    ordered.clear();
    remaining.clear();
    platform.journal.clear();
    state.ResumeTiming();
  }
}
BENCHMARK(orderTheItems)->Arg(kFew)->Arg(kMany)->Unit(benchmark::kMillisecond);

}  // namespace
}  // namespace appsync::bench
