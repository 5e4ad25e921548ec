#include <algorithm>
#include <array>
#include <cstdint>
#include <string>
#include <string_view>

#include <gtest/gtest.h>
#include <sys/resource.h>

#include "device/screen/IconImage.h"
#include "tests/device/screen/Pictures.h"

namespace appsync::test {
namespace {

using device::decodePNG;

constexpr std::string_view kSignature("\x89PNG\r\n\x1a\n", 8);

void append(Bytes& out, std::string_view text) {
  const ByteView bytes = bytesOf(text);
  out.insert(out.end(), bytes.begin(), bytes.end());
}

std::string bigEndian(std::uint32_t number) {
  std::string bytes;
  for (unsigned shift = 32; shift > 0; shift -= 8)
    bytes += static_cast<char>(number >> (shift - 8) & 0xFFU);
  return bytes;
}

std::uint32_t checksum(std::string_view bytes) {
  std::uint32_t sum = 0xFFFFFFFF;
  for (const char byte : bytes) {
    sum ^= static_cast<unsigned char>(byte);
    for (int bit = 0; bit < 8; ++bit)
      sum = sum >> 1U ^ (0xEDB88320U & (0U - (sum & 1U)));
  }
  return ~sum;
}

std::string chunk(std::string_view type, std::string_view content) {
  const std::string body = std::string(type) + std::string(content);
  return bigEndian(static_cast<std::uint32_t>(content.size())) + body + bigEndian(checksum(body));
}

std::string header(std::uint32_t width, std::uint32_t height) {
  return chunk("IHDR", bigEndian(width) + bigEndian(height) + std::string("\x08\x06\0\0\0", 5));
}

Bytes file(std::string_view chunks) {
  Bytes bytes;
  append(bytes, kSignature);
  append(bytes, chunks);
  return bytes;
}

/// Returns a complete file with additional chunks after its header.
Bytes withChunks(const Bytes& png, std::string_view chunks) {
  constexpr std::ptrdiff_t kHeaderEnd = 8 + 25;
  Bytes bytes(png.begin(), png.begin() + kHeaderEnd);
  append(bytes, chunks);
  bytes.insert(bytes.end(), png.begin() + kHeaderEnd, png.end());
  return bytes;
}

long peakMemoryKilobytes() {
  rusage usage{};
  getrusage(RUSAGE_SELF, &usage);
  return usage.ru_maxrss;
}

TEST(DecodePNG, ReturnsEncodedImage) {
  const auto original = makePicture(31, 17, kRed, kBlue);
  const auto decoded = decodePNG(pngOf(original.get()));
  ASSERT_NE(decoded, nullptr);
  EXPECT_EQ(cairo_image_surface_get_width(decoded.get()), 31);
  EXPECT_EQ(cairo_image_surface_get_height(decoded.get()), 17);
  for (int y = 0; y < 17; ++y) {
    for (int x = 0; x < 31; ++x)
      ASSERT_EQ(pixelAt(decoded.get(), x, y), x < 15 ? kRed : kBlue) << x << "," << y;
  }
}

TEST(DecodePNG, KeepsTransparency) {
  const device::Surface picture(cairo_image_surface_create(CAIRO_FORMAT_ARGB32, 2, 1));
  const device::Context context(cairo_create(picture.get()));
  cairo_set_source_rgba(context.get(), 1, 1, 1, 0.5);
  cairo_rectangle(context.get(), 0, 0, 1, 1);
  cairo_fill(context.get());
  cairo_surface_flush(picture.get());
  const auto decoded = decodePNG(pngOf(picture.get()));
  ASSERT_NE(decoded, nullptr);
  EXPECT_EQ(pixelAt(decoded.get(), 0, 0), pixelAt(picture.get(), 0, 0));
  EXPECT_EQ(pixelAt(decoded.get(), 1, 0), kNothing);
}

TEST(DecodePNG, RejectsOtherFormats) {
  EXPECT_EQ(decodePNG({}), nullptr);
  EXPECT_EQ(decodePNG(bytesOf("GIF89a")), nullptr);
  EXPECT_EQ(decodePNG(bytesOf(kSignature)), nullptr);
  EXPECT_EQ(decodePNG(file(chunk("IEND", ""))), nullptr);
}

TEST(DecodePNG, RejectsTruncationAtAnyByte) {
  const Bytes png = makePNG(8, 8, kRed);
  for (std::size_t length = 0; length < png.size(); ++length) {
    ASSERT_EQ(decodePNG(ByteView(png).first(length)), nullptr) << length;
  }
}

TEST(DecodePNG, SurvivesDamageOfAnyByte) {
  const Bytes png = makePNG(8, 8, kRed);
  for (std::size_t at = 0; at < png.size(); ++at) {
    Bytes damaged = png;
    damaged[at] = ~damaged[at];
    const auto decoded = decodePNG(damaged);
    if (decoded) {
      EXPECT_EQ(cairo_image_surface_get_width(decoded.get()), 8) << at;
    }
  }
}

TEST(DecodePNG, RejectsTooManyPixels) {
  const long before = peakMemoryKilobytes();
  constexpr std::array<std::pair<std::uint32_t, std::uint32_t>, 6> kSizes{
      {{30'000, 30'000}, {2049, 2048}, {1, 0x7FFFFFFF}, {0x7FFFFFFF, 1}, {0xFFFFFFFF, 0xFFFFFFFF}, {0x10000, 0x10000}}};
  for (const auto& [width, height] : kSizes) {
    EXPECT_EQ(decodePNG(file(header(width, height) + chunk("IDAT", "x") + chunk("IEND", ""))), nullptr) << width;
  }
  EXPECT_LT(peakMemoryKilobytes() - before, 20'000);
}

TEST(DecodePNG, RejectsEmptyImages) {
  EXPECT_EQ(decodePNG(file(header(0, 5) + chunk("IDAT", "x") + chunk("IEND", ""))), nullptr);
  EXPECT_EQ(decodePNG(file(header(5, 0) + chunk("IDAT", "x") + chunk("IEND", ""))), nullptr);
}

TEST(DecodePNG, RejectsRepeatedAndLateHeader) {
  const Bytes png = makePNG(8, 8, kRed);
  EXPECT_EQ(decodePNG(withChunks(png, header(30'000, 30'000))), nullptr);
  EXPECT_EQ(decodePNG(file(chunk("tEXt", "a") + header(8, 8) + chunk("IEND", ""))), nullptr);
}

TEST(DecodePNG, RejectsChunkLongerThanFile) {
  Bytes bytes = makePNG(8, 8, kRed);
  bytes = withChunks(bytes, bigEndian(0xFFFFFFF0) + "IDAT");
  EXPECT_EQ(decodePNG(bytes), nullptr);
}

TEST(DecodePNG, IgnoresTextAndProfiles) {
  const Bytes png = makePNG(8, 8, kGreen);
  const auto decoded = decodePNG(withChunks(png, chunk("zTXt", "broken") + chunk("iCCP", "broken too")));
  ASSERT_NE(decoded, nullptr);
  EXPECT_EQ(pixelAt(decoded.get(), 4, 4), kGreen);
}

TEST(DecodePNG, IgnoresBytesAfterEnd) {
  Bytes png = makePNG(8, 8, kGreen);
  append(png, "anything");
  EXPECT_NE(decodePNG(png), nullptr);
}

}  // namespace
}  // namespace appsync::test
