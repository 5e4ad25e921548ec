// How long one placeholder's icon takes, from the file in the app's bundle to the PNG bytes for the home screen. A sync
// makes one for each app: about a millisecond each is what it can spare.
#include <cstdlib>
#include <filesystem>
#include <memory>
#include <string>

#include <benchmark/benchmark.h>
#include <unistd.h>

#include "device/Device.h"
#include "device/screen/IconImage.h"

namespace {

namespace fs = std::filesystem;
using namespace appsync;

constexpr const char* kBundle = "/var/A.app";

/// A gradient with a letter on it, as icons are.
Bytes iconOf(int size) {
  const device::Surface picture(cairo_image_surface_create(CAIRO_FORMAT_ARGB32, size, size));
  const device::Context context(cairo_create(picture.get()));
  cairo_pattern_t* gradient = cairo_pattern_create_linear(0, 0, size, size);
  cairo_pattern_add_color_stop_rgb(gradient, 0, 0.2, 0.4, 0.9);
  cairo_pattern_add_color_stop_rgb(gradient, 1, 0.9, 0.3, 0.5);
  cairo_set_source(context.get(), gradient);
  cairo_pattern_destroy(gradient);
  cairo_paint(context.get());
  cairo_set_source_rgb(context.get(), 1, 1, 1);
  cairo_set_font_size(context.get(), size * 0.6);
  cairo_move_to(context.get(), size * 0.25, size * 0.7);
  cairo_show_text(context.get(), "A");
  cairo_surface_flush(picture.get());
  Bytes png;
  if (!device::encodePNG(picture.get(), png)) std::abort();
  return png;
}

/// A device with one bundle, whose icon is of that size.
class BundleWithIcon {
 public:
  explicit BundleWithIcon(int size)
      : folder_(fs::temp_directory_path() / ("appsync-icon-" + std::to_string(getpid()))) {
    auto made = device::Device::create(folder_.string());
    if (!made) std::abort();
    device_ = std::move(made).value();
    platform::FileSystem& files = services().fileSystem();
    const std::string bundle = kBundle;
    const bool isMade =
        files.createDirectory(bundle, platform::IntermediateDirectories::create, {}).ok() &&
        files.writeFileAtomically(bundle + "/Info.plist", bytesOf("{BundleIconFile = \"Icon.png\";}")).ok() &&
        files.writeFileAtomically(bundle + "/Icon.png", iconOf(size)).ok();
    if (!isMade) std::abort();
  }
  ~BundleWithIcon() {
    device_.reset();
    fs::remove_all(folder_);
  }
  BundleWithIcon(const BundleWithIcon&) = delete;
  BundleWithIcon& operator=(const BundleWithIcon&) = delete;

  [[nodiscard]] device::Services& services() { return device_->services(); }

 private:
  fs::path folder_;
  std::unique_ptr<device::Device> device_;
};

void makeIcon(benchmark::State& state) {
  BundleWithIcon subject(static_cast<int>(state.range(0)));
  device::Services& services = subject.services();
  for (auto _ : state) {
    const auto bundle = services.bundles().openBundle(platform::FileLocation::directory(kBundle).value());
    const auto image = services.iconRenderer().createHomeScreenIconImage(*bundle);
    Bytes png;
    const auto encoder = services.pngEncoders().createEncoder(png, 1);
    encoder->addImage(*image);
    if (!encoder->finalize()) state.SkipWithError("no icon");
    benchmark::DoNotOptimize(png);
  }
}
BENCHMARK(makeIcon)->Name("Icon/make")->Arg(60)->Arg(120)->Arg(180)->Arg(512)->Arg(1024)->Unit(benchmark::kMillisecond);

}  // namespace
