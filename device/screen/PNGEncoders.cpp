#include "device/screen/PNGEncoders.h"

#include <utility>

#include "device/screen/IconImage.h"

namespace appsync::device {

namespace {

class SingleImageEncoder final : public platform::PNGEncoder {
 public:
  explicit SingleImageEncoder(Bytes& destination) : destination_(destination) {}

  void addImage(const platform::Image& image) override {
    const auto* icon = dynamic_cast<const IconImage*>(&image);
    hasFailed_ = hasFailed_ || !picture_.empty() || icon == nullptr || !encodePNG(icon->surface(), picture_);
  }

  [[nodiscard]] bool finalize() override {
    if (hasFailed_ || picture_.empty()) return false;
    destination_ = std::exchange(picture_, {});
    return true;
  }

 private:
  Bytes& destination_;
  Bytes picture_;
  bool hasFailed_ = false;
};

}  // namespace

std::unique_ptr<platform::PNGEncoder> PNGEncoders::createEncoder(Bytes& destination, std::size_t imageCount) {
  return imageCount == 1 ? std::make_unique<SingleImageEncoder>(destination) : nullptr;
}

}  // namespace appsync::device
