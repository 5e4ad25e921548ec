// How long installing 200 packages of about 1 MB takes with ten threads: the registry against a program that only
// unpacks them, brings them to the disk and gives them their names. The first may take 1.6 times as long as the second.
#include <filesystem>
#include <string>

#include <benchmark/benchmark.h>
#include <unistd.h>

#include "bench/device/InstallCorpus.h"
#include "device/Device.h"

namespace {

using namespace appsync;
using namespace appsync::bench;

/// What the registry does with packages that lie where a host has put them; `rounds` counts earlier versions.
void install(benchmark::State& state, int rounds) {
  library();
  for (auto _ : state) {
    state.PauseTiming();
    const fs::path folder = library().fresh();
    auto device = device::Device::create(folder);
    require(device.ok(), "the device cannot be made");
    const fs::path staging = folder / "root/var/mobile/Media/PublicStaging";
    for (int number = 0; number < kPackages; ++number) {
      fs::create_hard_link(library().package(number), staging / std::to_string(number));
    }
    device::AppRegistry& registry = (*device)->services().defaultRegistry();
    const auto installAll = [&] {
      onTenThreads([&](int number) {
        const Status installed =
            registry.installApplication({"/var/mobile/Media/PublicStaging/" + std::to_string(number)},
                                        {{platform::PackageTypeKey, platform::PackageTypeCustomer},
                                         {platform::BundleIdentifierKey, identifierOf(number)}});
        require(installed.ok(), "an app cannot be installed");
      });
    };
    for (int round = 0; round < rounds; ++round)
      installAll();
    sync();
    state.ResumeTiming();
    installAll();
    state.PauseTiming();
    device = Error{};
    state.ResumeTiming();
  }
}

void Install(benchmark::State& state) {
  install(state, 0);
}
void Update(benchmark::State& state) {
  install(state, 1);
}

BENCHMARK(measureUnpacking)->Name("UnpackOnly")->Unit(benchmark::kMillisecond)->UseRealTime()->Iterations(1);
BENCHMARK(Install)->Unit(benchmark::kMillisecond)->UseRealTime()->Iterations(1);
BENCHMARK(Update)->Unit(benchmark::kMillisecond)->UseRealTime()->Iterations(1);

}  // namespace
