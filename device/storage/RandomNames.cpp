#include "device/storage/RandomNames.h"

#include <array>
#include <string_view>

#include <sys/random.h>

namespace appsync::device {

namespace {

template <std::size_t size>
std::array<unsigned char, size> randomBytes() {
  std::array<unsigned char, size> bytes{};
  while (getrandom(bytes.data(), size, 0) != static_cast<ssize_t>(size)) {
  }
  return bytes;
}

void appendHex(std::string& text, unsigned char byte, std::string_view digits) {
  text += digits[byte >> 4];
  text += digits[byte & 0x0F];
}

}  // namespace

std::string newUUID() {
  auto bytes = randomBytes<16>();
  bytes[6] = static_cast<unsigned char>((bytes[6] & 0x0F) | 0x40);
  bytes[8] = static_cast<unsigned char>((bytes[8] & 0x3F) | 0x80);
  std::string name;
  for (std::size_t index = 0; index < bytes.size(); ++index) {
    if (index == 4 || index == 6 || index == 8 || index == 10) name += '-';
    appendHex(name, bytes[index], "0123456789ABCDEF");
  }
  return name;
}

std::string temporaryName() {
  std::string name;
  for (const unsigned char byte : randomBytes<kTemporaryNameDigits / 2>())
    appendHex(name, byte, "0123456789abcdef");
  return name;
}

}  // namespace appsync::device
