// Renders home-screen icons of app bundles and encodes images as PNG.
#pragma once

#include <cstddef>
#include <memory>

#include "base/Bytes.h"
#include "platform/Bundle.h"

namespace appsync::platform {

/// An image in the service's internal format. Immutable and thread-safe.
class Image {
 public:
  virtual ~Image() = default;
};

/// Thread-safe.
class IconRenderer {
 public:
  virtual ~IconRenderer() = default;

  /// Returns the bundle's icon in the size and shape of this device's home screen, or null if the bundle has no usable
  /// icon. The image may outlive the bundle.
  [[nodiscard]] virtual std::unique_ptr<Image> createHomeScreenIconImage(const Bundle& bundle) = 0;
};

/// Encodes images as PNG. Not thread-safe. Destroying an encoder before `finalize` abandons the encoding.
class PNGEncoder {
 public:
  virtual ~PNGEncoder() = default;

  /// Adds an image, which is needed only during the call.
  virtual void addImage(const Image& image) = 0;

  /// Completes the encoding. Returns false on failure, also if an image is missing; the contents of the destination are
  /// then unspecified.
  [[nodiscard]] virtual bool finalize() = 0;
};

/// Thread-safe.
class PNGEncoders {
 public:
  virtual ~PNGEncoders() = default;

  /// Returns an encoder of `imageCount` images into `destination`, which must outlive it, or null if the service cannot
  /// create one.
  [[nodiscard]] virtual std::unique_ptr<PNGEncoder> createEncoder(Bytes& destination, std::size_t imageCount) = 0;
};

}  // namespace appsync::platform
