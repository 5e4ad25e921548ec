#include "base/UTF8.h"

#include <array>
#include <cstdint>

namespace appsync::device {

Character firstCharacter(std::string_view text) {
  const auto byte = [&](std::size_t index) { return static_cast<std::uint8_t>(text[index]); };
  const std::uint8_t lead = byte(0);
  if (lead < 0x80) return {lead, 1, true};
  const std::size_t length = lead >= 0xF0 ? 4 : lead >= 0xE0 ? 3 : 2;
  if (lead < 0xC2 || lead > 0xF4 || text.size() < length) return {lead};
  char32_t code = lead & (0x7FU >> length);
  for (std::size_t index = 1; index < length; ++index) {
    if ((byte(index) & 0xC0U) != 0x80) return {lead};
    code = (code << 6U) | (byte(index) & 0x3FU);
  }
  constexpr std::array<char32_t, 5> kSmallest = {0, 0, 0x80, 0x800, 0x10000};
  if (code < kSmallest[length] || code > 0x10FFFF || (code >= 0xD800 && code <= 0xDFFF)) return {lead};
  return {code, length, true};
}

bool isUnsafeForDisplay(char32_t code) {
  return code < 0x20 || (code >= 0x7F && code <= 0x9F) || code == 0xAD || code == 0x61C ||
         (code >= 0x200B && code <= 0x200F && code != 0x200D) || (code >= 0x2028 && code <= 0x202E) ||
         (code >= 0x2060 && code <= 0x206F) || code == 0xFEFF || (code >= 0xFFF0 && code <= 0xFFFB) ||
         (code >= 0xE0000 && code <= 0xE0FFF);
}

}  // namespace appsync::device
