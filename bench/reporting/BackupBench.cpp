// What making apps ready for a backup costs when there are many: the time must grow with their number and no faster.
#include <string>

#include <benchmark/benchmark.h>

#include "core/AppsClient.h"
#include "kit/fakes/FakePlatform.h"
#include "kit/fakes/TodoList.h"

namespace appsync::bench {
namespace {

constexpr int kFew = 1'000;
constexpr int kMany = 10'000;

/// Every app's file is the same, and has to be rewritten each time anew.
class Files final : public test::FakeFileSystem {
 public:
  using FakeFileSystem::FakeFileSystem;

  [[nodiscard]] Result<Bytes> readFile(std::string_view) override { return metadata_; }
  [[nodiscard]] Status writeFileAtomically(std::string_view, ByteView) override {
    ++written;
    return {};
  }

  std::int64_t written = 0;

 private:
  const Bytes metadata_ = test::xmlForm(
      plist::Dictionary{{"DeviceBasedKLP", false}, {"bundleVersion", "1.2.3"}, {"itemId", 42}, {"title", "An App"}});
};

void prepareForBackup(benchmark::State& state) {
  test::FakePlatform platform;
  Files files(platform.journal);
  platform.use(files);
  for (std::int64_t number = 0; number < state.range(0); ++number)
    platform.registry.add(test::FakeApp::installed("com.example.app" + std::to_string(number)));
  for (const LogLevel level : {LogLevel::standard, LogLevel::error})
    platform.log.disable(8, level);
  const auto client = AppsClient::create(platform);
  for (auto _ : state) {
    files.written = 0;
    client->prepareForBackup();
    if (files.written != state.range(0)) return state.SkipWithError("not every file was rewritten");
  }
}
BENCHMARK(prepareForBackup)->Arg(kFew)->Arg(kMany)->Unit(benchmark::kMillisecond);

}  // namespace
}  // namespace appsync::bench
