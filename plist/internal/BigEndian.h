// Big-endian numbers of the binary format.
#pragma once

#include <bit>
#include <cstddef>
#include <cstdint>
#include <cstring>

namespace appsync::plist {

/// The bytes of a number, most significant first, as a number; or the inverse.
[[nodiscard]] inline std::uint64_t swapToBigEndian(std::uint64_t number) noexcept {
  if constexpr (std::endian::native == std::endian::big) return number;
  return __builtin_bswap64(number);
}

/// The number in the `size` bytes, 1 to 8, at `from`. Eight bytes there must be readable.
[[nodiscard]] inline std::uint64_t loadBigEndian(const std::byte* from, unsigned size) noexcept {
  std::uint64_t word;
  std::memcpy(&word, from, sizeof word);
  return swapToBigEndian(word) >> (64 - 8 * size);
}

/// Writes the low `size` bytes, 1 to 8, of `number`. Returns the end of the written bytes.
inline std::byte* storeBigEndian(std::uint64_t number, unsigned size, std::byte* to) noexcept {
  const std::uint64_t word = swapToBigEndian(number << (64 - 8 * size));
  switch (size) {
    case 1:
      std::memcpy(to, &word, 1);
      break;
    case 2:
      std::memcpy(to, &word, 2);
      break;
    case 4:
      std::memcpy(to, &word, 4);
      break;
    default:
      std::memcpy(to, &word, size);
      break;
  }
  return to + size;
}

}  // namespace appsync::plist
