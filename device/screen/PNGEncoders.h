// PNG encoders.
#pragma once

#include <memory>

#include "platform/IconRenderer.h"

namespace appsync::device {

/// Creates encoders of one image, the most that a PNG file can contain. They accept images of this device's
/// `IconRenderer`.
class PNGEncoders final : public platform::PNGEncoders {
 public:
  /// Null unless `imageCount` is 1.
  [[nodiscard]] std::unique_ptr<platform::PNGEncoder> createEncoder(Bytes& destination,
                                                                    std::size_t imageCount) override;
};

}  // namespace appsync::device
