// How long a whole `appsync sync` of 200 packages of about 1 MB takes, against a program that only unpacks them, brings
// them to the disk and gives them their names. The first may take 1.6 times as long as the second on a device that
// installs directly; one that installs through coordinators may take 1.2 times as long as that.
#include <filesystem>
#include <string>

#include <benchmark/benchmark.h>
#include <fcntl.h>
#include <unistd.h>

#include "bench/daemon/InstallCorpus.h"
#include "cli/CommandLine.h"
#include "device/Device.h"

namespace {

using namespace appsync;
using namespace appsync::bench;

/// Sends what is written to standard output nowhere, for as long as it lives.
class Silence {
 public:
  Silence() : saved_(dup(STDOUT_FILENO)) {
    const device::FileDescriptor nowhere(open("/dev/null", O_WRONLY | O_CLOEXEC));
    dup2(nowhere.get(), STDOUT_FILENO);
  }
  ~Silence() { dup2(saved_.get(), STDOUT_FILENO); }
  Silence(const Silence&) = delete;
  Silence& operator=(const Silence&) = delete;

 private:
  const device::FileDescriptor saved_;
};

/// The tool as it is started from a command line, in this process.
void wholeSync(benchmark::State& state, device::InstallMode mode) {
  library();
  for (auto _ : state) {
    state.PauseTiming();
    const std::string device = library().fresh();
    const std::string packages = library().packages();
    require(device::Device::create(device, mode).ok(), "the device cannot be made");
    sync();
    const char* const words[] = {"appsync", "sync", device.c_str(), packages.c_str()};
    state.ResumeTiming();
    const Silence silence;
    require(cli::runCommandLine(4, words) == cli::ExitStatus::done, "an app cannot be synced");
  }
}

void DirectSync(benchmark::State& state) {
  wholeSync(state, device::InstallMode::direct);
}
void CoordinatedSync(benchmark::State& state) {
  wholeSync(state, device::InstallMode::coordinated);
}

BENCHMARK(measureUnpacking)
    ->Name("Sync/unpackOnly")
    ->Unit(benchmark::kMillisecond)
    ->UseRealTime()
    ->Iterations(1)
    ->Repetitions(5);
BENCHMARK(DirectSync)->Name("Sync/whole")->Unit(benchmark::kMillisecond)->UseRealTime()->Iterations(1)->Repetitions(5);
BENCHMARK(CoordinatedSync)
    ->Name("Sync/coordinated")
    ->Unit(benchmark::kMillisecond)
    ->UseRealTime()
    ->Iterations(1)
    ->Repetitions(5);

}  // namespace
