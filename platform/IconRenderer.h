// From an app bundle to the picture that stands on the home screen, and from a picture to PNG bytes.
#pragma once

#include <cstddef>
#include <memory>

#include "base/Bytes.h"
#include "platform/Bundle.h"

namespace appsync::platform {

/// A picture in the service's own form. It can be read from any thread.
class Image {
 public:
  virtual ~Image() = default;
};

/// Threads: any.
class IconRenderer {
 public:
  virtual ~IconRenderer() = default;

  /// The bundle's icon in the size and shape of this device's home screen, or null when the bundle has none that can be
  /// used.
  [[nodiscard]] virtual std::unique_ptr<Image> createHomeScreenIconImage(const Bundle& bundle) = 0;
};

/// Writes images as PNG. One encoder, one thread.
class PNGEncoder {
 public:
  virtual ~PNGEncoder() = default;

  /// The image is copied or written before this returns.
  virtual void addImage(const Image& image) = 0;

  /// Completes the encoding; only after a true result the destination holds a picture.
  [[nodiscard]] virtual bool finalize() = 0;
};

class PNGEncoders {
 public:
  virtual ~PNGEncoders() = default;

  /// An encoder of `imageCount` images into `destination`, which must outlive it; null when the service has no such
  /// encoder.
  [[nodiscard]] virtual std::unique_ptr<PNGEncoder> createEncoder(Bytes& destination, std::size_t imageCount) = 0;
};

}  // namespace appsync::platform
