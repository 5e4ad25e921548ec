#include "device/screen/IconImage.h"

#include <algorithm>
#include <array>
#include <cstring>

namespace appsync::device {

namespace {

constexpr std::array<unsigned char, 8> kSignature{0x89, 'P', 'N', 'G', '\r', '\n', 0x1A, '\n'};
/// A chunk is its length, type, content and checksum.
constexpr std::size_t kChunkFrame = 12;
/// The chunks of the image itself. Text and profiles, which can expand to any size, are not decoded.
constexpr std::array<std::string_view, 5> kPictureChunks{"IHDR", "PLTE", "tRNS", "IDAT", "IEND"};

std::uint32_t bigEndian(ByteView bytes) {
  std::uint32_t number = 0;
  for (const std::byte byte : bytes.first(4))
    number = number << 8U | std::to_integer<std::uint32_t>(byte);
  return number;
}

bool startsLikePNG(ByteView bytes) {
  return bytes.size() > kSignature.size() && std::memcmp(bytes.data(), kSignature.data(), kSignature.size()) == 0;
}

bool hasBoundedSize(ByteView header) {
  if (header.size() < 8) return false;
  const std::uint64_t width = bigEndian(header);
  const std::uint64_t height = bigEndian(header.subspan(4));
  return width > 0 && height > 0 && width <= kMaximumPixels && height <= kMaximumPixels / width;
}

/// Returns the file with the chunks of the image only, or no bytes if it is not a PNG file or has too many pixels.
Bytes pictureOnly(ByteView file) {
  if (!startsLikePNG(file)) return {};
  Bytes picture(file.begin(), file.begin() + kSignature.size());
  ByteView rest = file.subspan(kSignature.size());
  for (bool isFirst = true; rest.size() >= kChunkFrame; isFirst = false) {
    const std::size_t length = bigEndian(rest);
    if (length > rest.size() - kChunkFrame) return {};
    const std::string_view type = textOf(rest.subspan(4, 4));
    if (isFirst != (type == "IHDR")) return {};
    if (isFirst && !hasBoundedSize(rest.subspan(8, length))) return {};
    const ByteView chunk = rest.first(length + kChunkFrame);
    if (std::ranges::find(kPictureChunks, type) != kPictureChunks.end()) {
      picture.insert(picture.end(), chunk.begin(), chunk.end());
    }
    if (type == "IEND") return picture;
    rest = rest.subspan(chunk.size());
  }
  return {};
}

cairo_status_t readNext(void* context, unsigned char* to, unsigned int length) {
  ByteView& rest = *static_cast<ByteView*>(context);
  if (length > rest.size()) return CAIRO_STATUS_READ_ERROR;
  std::memcpy(to, rest.data(), length);
  rest = rest.subspan(length);
  return CAIRO_STATUS_SUCCESS;
}

cairo_status_t append(void* context, const unsigned char* from, unsigned int length) {
  Bytes& out = *static_cast<Bytes*>(context);
  const auto* bytes = reinterpret_cast<const std::byte*>(from);
  out.insert(out.end(), bytes, bytes + length);
  return CAIRO_STATUS_SUCCESS;
}

}  // namespace

Surface decodePNG(ByteView bytes) {
  const Bytes picture = pictureOnly(bytes);
  if (picture.empty()) return nullptr;
  ByteView rest = picture;
  Surface surface(cairo_image_surface_create_from_png_stream(readNext, &rest));
  return cairo_surface_status(surface.get()) == CAIRO_STATUS_SUCCESS ? std::move(surface) : nullptr;
}

bool encodePNG(cairo_surface_t* picture, Bytes& out) {
  return cairo_surface_write_to_png_stream(picture, append, &out) == CAIRO_STATUS_SUCCESS;
}

}  // namespace appsync::device
