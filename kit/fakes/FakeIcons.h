// Icons and PNG encoders.
#pragma once

#include <cstddef>
#include <memory>
#include <mutex>
#include <string>
#include <string_view>

#include "kit/fakes/CallJournal.h"
#include "kit/fakes/FakeFileSystem.h"
#include "platform/IconRenderer.h"

namespace appsync::test {

/// Renders a bundle whose info dictionary names an existing icon file that is not empty. Journal line:
/// "iconRenderer.createHomeScreenIconImage /path".
class FakeIconRenderer final : public platform::IconRenderer {
 public:
  FakeIconRenderer(CallJournal& journal, FakeFileSystem& files) : journal_(journal), files_(files) {}

  [[nodiscard]] std::unique_ptr<platform::Image> createHomeScreenIconImage(const platform::Bundle& bundle) override;

 private:
  CallJournal& journal_;
  FakeFileSystem& files_;
};

enum class EncoderFailure { none, creation, finalization };

/// Journal lines: "pngEncoders.createEncoder", "pngEncoder.addImage", "pngEncoder.finalize".
/// Fails the test if an encoder receives more images than announced or an image of another service, or is finalized
/// twice.
class FakePNGEncoders final : public platform::PNGEncoders {
 public:
  explicit FakePNGEncoders(CallJournal& journal) : journal_(journal) {}

  void fail(EncoderFailure failure);

  /// Returns the encoding of an icon with these contents.
  [[nodiscard]] static std::string pngOf(std::string_view iconFile);

  [[nodiscard]] std::unique_ptr<platform::PNGEncoder> createEncoder(Bytes& destination,
                                                                    std::size_t imageCount) override;

 private:
  CallJournal& journal_;
  std::mutex mutex_;
  EncoderFailure failure_ = EncoderFailure::none;
};

}  // namespace appsync::test
