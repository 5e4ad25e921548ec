#include "kit/fakes/FakeIcons.h"

#include <optional>
#include <utility>

#include "kit/fakes/CallJournal.h"
#include "platform/Keys.h"
#include "plist/Access.h"

namespace appsync::test {

namespace {

class FakeImage final : public platform::Image {
 public:
  explicit FakeImage(std::string iconFile) : iconFile_(std::move(iconFile)) {}
  [[nodiscard]] const std::string& iconFile() const { return iconFile_; }

 private:
  std::string iconFile_;
};

class FakePNGEncoder final : public platform::PNGEncoder {
 public:
  FakePNGEncoder(CallJournal& journal, Bytes& destination, std::size_t imageCount, EncoderFailure failure)
      : journal_(journal), destination_(destination), imagesLeft_(imageCount), failure_(failure) {}

  void addImage(const platform::Image& image) override {
    const auto* known = dynamic_cast<const FakeImage*>(&image);
    if (known == nullptr) return misuse("an encoder receives an image of another service");
    if (imagesLeft_ == 0) return misuse("an encoder receives more images than announced");
    if (journal_.beforeCall("pngEncoder.addImage")) return;
    --imagesLeft_;
    encoded_ += FakePNGEncoders::pngOf(known->iconFile());
  }

  [[nodiscard]] bool finalize() override {
    if (std::exchange(isFinished_, true)) misuse("an encoder is finalized twice");
    if (journal_.beforeCall("pngEncoder.finalize")) return false;
    if (failure_ == EncoderFailure::finalization || imagesLeft_ != 0) return false;
    const ByteView bytes = bytesOf(encoded_);
    destination_.assign(bytes.begin(), bytes.end());
    return true;
  }

 private:
  CallJournal& journal_;
  Bytes& destination_;
  std::size_t imagesLeft_;
  EncoderFailure failure_;
  std::string encoded_;
  bool isFinished_ = false;
};

}  // namespace

std::unique_ptr<platform::Image> FakeIconRenderer::createHomeScreenIconImage(const platform::Bundle& bundle) {
  const std::string& folder = bundle.location().path;
  if (journal_.beforeCall("iconRenderer.createHomeScreenIconImage", folder)) return nullptr;
  const auto name = stringIn(bundle.infoDictionaryValue(platform::kBundleIconFileKey));
  if (!name) return nullptr;
  const std::optional<std::string> icon = files_.text(folder + "/" + std::string(*name));
  if (!icon || icon->empty()) return nullptr;
  return std::make_unique<FakeImage>(*icon);
}

void FakePNGEncoders::fail(EncoderFailure failure) {
  const std::scoped_lock lock(mutex_);
  failure_ = failure;
}

std::string FakePNGEncoders::pngOf(std::string_view iconFile) {
  return std::string("\x89PNG\r\n\x1a\n").append("picture of ").append(iconFile);
}

std::unique_ptr<platform::PNGEncoder> FakePNGEncoders::createEncoder(Bytes& destination, std::size_t imageCount) {
  if (journal_.beforeCall("pngEncoders.createEncoder")) return nullptr;
  const std::scoped_lock lock(mutex_);
  if (failure_ == EncoderFailure::creation) return nullptr;
  return std::make_unique<FakePNGEncoder>(journal_, destination, imageCount, failure_);
}

}  // namespace appsync::test
