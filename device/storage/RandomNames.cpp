#include "device/storage/RandomNames.h"

#include <array>
#include <string_view>

#include <sys/random.h>

namespace appsync::device {

std::string newUUID() {
  std::array<unsigned char, 16> bytes{};
  while (getrandom(bytes.data(), bytes.size(), 0) != static_cast<ssize_t>(bytes.size())) {
  }
  bytes[6] = static_cast<unsigned char>((bytes[6] & 0x0F) | 0x40);
  bytes[8] = static_cast<unsigned char>((bytes[8] & 0x3F) | 0x80);
  std::string name;
  for (std::size_t index = 0; index < bytes.size(); ++index) {
    if (index == 4 || index == 6 || index == 8 || index == 10) name += '-';
    constexpr std::string_view kDigits = "0123456789ABCDEF";
    name += kDigits[bytes[index] >> 4];
    name += kDigits[bytes[index] & 0x0F];
  }
  return name;
}

}  // namespace appsync::device
