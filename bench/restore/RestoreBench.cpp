// What a restore costs when the backup held many apps: the time must grow with their number and no faster, and memory
// not beyond the host's file and a few of its apps.
#include <algorithm>
#include <cerrno>
#include <functional>
#include <memory>
#include <string>
#include <utility>

#include <benchmark/benchmark.h>
#include <malloc.h>

#include "core/AppsClient.h"
#include "kit/fakes/FakePlatform.h"
#include "kit/fakes/SyncFileBuilder.h"
#include "tests/support/HeldMemory.h"
#include "tests/support/ManyApps.h"

namespace appsync::bench {
namespace {

using test::FakePlatform;

constexpr int kFew = 200;
constexpr int kMany = 2'000;
constexpr std::size_t kIconSize = 20'000;
constexpr std::size_t kLicenceSize = 1'000;

constexpr std::string_view kRestoreInfo = "/var/mobile/Media/HarvoRestore/RestoreApplications.plist";

plist::Value restoredApp(std::int64_t number) {
  const std::string name = "App number " + std::to_string(number);
  const plist::Dictionary metadata{{"title", name}, {"bundleVersion", "1.2.3"}, {"itemId", number}};
  Bytes licence(kLicenceSize, static_cast<std::byte>(number));
  Bytes icon(kIconSize, static_cast<std::byte>(number >> 8));
  std::copy_n(bytesOf(name).begin(), name.size(), licence.begin());
  std::copy_n(bytesOf(name).begin(), name.size(), icon.begin());
  return plist::Dictionary{{"ApplicationSINF", std::move(licence)},
                           {"HarvoMetadata", test::xmlForm(metadata)},
                           {"PlaceholderIcon", std::move(icon)}};
}

Bytes restoreInfo(std::int64_t count) {
  plist::Dictionary apps;
  for (std::int64_t number = 0; number < count; ++number)
    apps.set("com.example.app" + std::to_string(1'000'000 + number), restoredApp(number));
  return test::binaryForm(apps);
}

// A device that keeps nothing of what it is given.

class Files final : public test::FakeFileSystem {
 public:
  using FakeFileSystem::FakeFileSystem;

  /// The host's file; reading it gives it away.
  Bytes document;

  [[nodiscard]] bool fileExists(std::string_view) override { return true; }
  [[nodiscard]] Result<platform::FileAttributes> attributesOfItem(std::string_view) override {
    return platform::FileAttributes{kIconSize, false};
  }
  [[nodiscard]] Result<Bytes> readFile(std::string_view path) override {
    if (path == kRestoreInfo) return std::move(document);
    return Error::fromErrno(ENOENT);
  }
  [[nodiscard]] Status writeFileAtomically(std::string_view, ByteView) override { return {}; }
  [[nodiscard]] Status createFile(std::string_view, ByteView, const platform::OwnerAttributes&) override { return {}; }
  [[nodiscard]] Status createDirectory(std::string_view, platform::IntermediateDirectories,
                                       const platform::OwnerAttributes&) override {
    return {};
  }
  [[nodiscard]] Status moveItem(std::string_view, std::string_view) override { return {}; }
  [[nodiscard]] Status removeItem(std::string_view) override { return {}; }
  [[nodiscard]] std::string temporaryDirectory() override { return "/tmp"; }
};

class Registry final : public test::NoApps {
 public:
  /// Meets every placeholder that was installed.
  void enumerateBundlesOfType(
      platform::BundleKind,
      const std::function<void(const platform::BundleRecord& bundle, bool& stop)>& visit) override {
    bool stop = false;
    for (std::int64_t number = 0; number < installed && !stop; ++number)
      visit(test::FakeBundleRecord("com.example.other" + std::to_string(number)), stop);
  }
  [[nodiscard]] Status installApplication(const platform::FileLocation&, const plist::Dictionary&) override {
    ++installed;
    return {};
  }

  std::int64_t installed = 0;
};

class Transactions final : public platform::TransactionLog {
 public:
  void initializeWithLog(std::shared_ptr<platform::SystemLogHandle>) override {}
  void logStep(platform::TransactionStep, platform::TransactionParty, platform::TransactionPhase, bool,
               std::string_view, std::string_view) override {}
  void logScenario(std::string_view, std::uint32_t, bool, std::string_view, std::string_view) override {}
};

/// The host's file and three times its largest app.
std::size_t allowedMemory(const Bytes& document) {
  return document.size() + 3 * (kIconSize + kLicenceSize);
}

/// So that the size of a file decides about nothing but its bytes.
void keepFreedMemory() {
  constexpr int kEverything = 1 << 30;
  mallopt(M_MMAP_THRESHOLD, kEverything);
  mallopt(M_TRIM_THRESHOLD, kEverything);
}

void processRestoreInfo(benchmark::State& state) {
  keepFreedMemory();
  const Bytes document = restoreInfo(state.range(0));
  FakePlatform platform;
  Files files(platform.journal);
  Registry registry;
  Transactions transactions;
  platform.use(files);
  platform.use(registry);
  platform.use(transactions);
  for (const int category : {8, 14})
    platform.log.disable(category);
  const auto client = AppsClient::create(platform);
  std::size_t most = 0;
  for (auto _ : state) {
    state.PauseTiming();
    registry.installed = 0;
    most = test::memory::mostHeldDuring([&] {
      files.document = document;
      state.ResumeTiming();
      client->_processHarvoRestoreInfo();
    });
    if (registry.installed != state.range(0)) return state.SkipWithError("not every app got its placeholder");
    if (most > allowedMemory(document)) return state.SkipWithError("it took too much memory");
  }
  state.counters["file"] = static_cast<double>(document.size());
  state.counters["memory"] = static_cast<double>(most);
}
BENCHMARK(processRestoreInfo)->Arg(kFew)->Arg(kMany)->Unit(benchmark::kMillisecond);

}  // namespace
}  // namespace appsync::bench
