// Pictures to PNG bytes.
#pragma once

#include <memory>

#include "platform/IconRenderer.h"

namespace appsync::device {

/// Encoders of one image: PNG files hold no more. They accept the images of this device's `IconRenderer`.
class PNGEncoders final : public platform::PNGEncoders {
 public:
  /// Null unless `imageCount` is 1.
  [[nodiscard]] std::unique_ptr<platform::PNGEncoder> createEncoder(Bytes& destination,
                                                                    std::size_t imageCount) override;
};

}  // namespace appsync::device
