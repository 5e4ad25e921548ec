// What a sync's questions cost when there are many apps: the time must grow with their number and no faster. Those that
// only ask are put to an embedded device; the one that makes a placeholder for each app has a platform of fakes, so
// that it is not the disk that is measured.
#include <filesystem>
#include <map>
#include <memory>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include <benchmark/benchmark.h>
#include <unistd.h>

#include "core/AppsClient.h"
#include "device/Device.h"
#include "kit/fakes/FakePlatform.h"
#include "kit/fakes/SyncFileBuilder.h"

namespace appsync::bench {
namespace {

using test::FakeApp;
using test::FakePlatform;

constexpr int kFew = 1'000;
constexpr int kMany = 10'000;
constexpr std::string_view kLastSyncState = "/var/mobile/Library/ApplicationSync/LastSyncAppState.plist";

std::string identifier(std::string_view kind, std::int64_t number) {
  return "com.example." + std::string(kind) + std::to_string(number);
}

plist::Array todoEntries(std::int64_t count) {
  plist::Array entries;
  for (std::int64_t number = 0; number < count; ++number)
    entries.emplace_back(test::installEntry(identifier("wanted", number)));
  return entries;
}

/// As many todo entries as placeholders, none of them for the same app; every second icon stands on the home screen.
void prepare(FakePlatform& platform, std::int64_t count) {
  std::vector<std::string> icons;
  for (std::int64_t number = 0; number < count; ++number) {
    platform.registry.add(FakeApp::placeholder(identifier("waiting", number), platform::TSInstallType::Restore));
    if (number % 2 == 0) icons.push_back(identifier("wanted", number));
  }
  platform.files.put(test::kTodoListPath, test::binaryForm(todoEntries(count)));
  platform.screen.setFlattenedIconState(icons);
  for (const int category : {8, 14})
    platform.log.disable(category);
}

/// The same on an embedded device, from which as many apps have been removed.
class DeviceWithApps {
 public:
  explicit DeviceWithApps(std::int64_t count) {
    auto made = device::Device::create(folder_);
    require(made.ok());
    device_ = std::move(made).value();
    require(fillDatabase(count).ok());
    plist::Array icons;
    plist::Array lastSync;
    for (std::int64_t number = 0; number < count; ++number) {
      if (number % 2 == 0) icons.emplace_back(identifier("wanted", number));
      lastSync.emplace_back(identifier(number % 2 == 0 ? "wanted" : "waiting", number));
    }
    device::Services& services = device_->services();
    services.homeScreen().setIconState(services.homeScreen().blockableServerPort(), test::binaryForm(icons));
    write(test::kTodoListPath, todoEntries(count));
    write(kLastSyncState, lastSync);
  }
  ~DeviceWithApps() {
    device_.reset();
    std::filesystem::remove_all(folder_);
  }
  DeviceWithApps(const DeviceWithApps&) = delete;
  DeviceWithApps& operator=(const DeviceWithApps&) = delete;

  [[nodiscard]] platform::Platform& platform() { return device_->platform(); }

 private:
  static void require(bool done) {
    if (!done) throw std::runtime_error("the device cannot be prepared");
  }

  Status fillDatabase(std::int64_t count) {
    device::Database::Transaction transaction(device_->services().database());
    for (std::int64_t number = 0; number < count; ++number) {
      const std::string waiting = identifier("waiting", number);
      const device::StoredBundle bundle{.container = waiting,
                                        .folder = "Waiting.app",
                                        .name = "Waiting",
                                        .version = {},
                                        .installType = platform::TSInstallType::Restore};
      device::app_table::put(transaction, waiting, platform::kApplicationTypeUser, device::BundleRole::placeholder,
                             bundle, {})
          .ignore();
      device::UninstalledApps::add(transaction, identifier("removed", number)).ignore();
    }
    return transaction.commit();
  }

  void write(std::string_view path, const plist::Array& list) {
    platform::FileSystem& files = platform().fileSystem();
    const std::string folder(path.substr(0, path.rfind('/')));
    require(files.createDirectory(folder, platform::IntermediateDirectories::create, {}).ok());
    require(files.writeFileAtomically(path, test::binaryForm(list)).ok());
  }

  const std::string folder_ = std::filesystem::temp_directory_path() / ("appsync-growth-" + std::to_string(getpid()));
  std::unique_ptr<device::Device> device_;
};

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
  DeviceWithApps device(state.range(0));
  const auto client = AppsClient::create(device.platform());
  for (auto _ : state) {
    auto deleted = client->installedAssets();
    state.PauseTiming();
    deleted = {};
    state.ResumeTiming();
  }
}
BENCHMARK(installedAssets)->Arg(kFew)->Arg(kMany)->Unit(benchmark::kMillisecond);

void orderTheItems(benchmark::State& state) {
  DeviceWithApps device(state.range(0));
  std::map<std::string, std::string, std::less<>> items;
  for (std::int64_t number = 0; number < state.range(0); ++number) {
    items.emplace(identifier("wanted", number), "item");
  }
  for (auto _ : state) {
    state.PauseTiming();
    auto remaining = items;
    state.ResumeTiming();
    auto ordered = AppsClient::_orderTheItems(device.platform(), remaining);
    state.PauseTiming();
    ordered.clear();
    remaining.clear();
    state.ResumeTiming();
  }
}
BENCHMARK(orderTheItems)->Arg(kFew)->Arg(kMany)->Unit(benchmark::kMillisecond);

}  // namespace
}  // namespace appsync::bench
