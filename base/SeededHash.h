// Hashes with a random seed for each process, so that untrusted keys cannot be chosen to collide.
#pragma once

#include <array>
#include <bit>
#include <cstddef>
#include <cstdint>
#include <string_view>

namespace appsync {

/// The unit of hashing: 32 bytes.
using HashedBlock = std::array<std::uint64_t, 4>;

namespace detail {

inline constexpr HashedBlock kHashFactors = {0xA0761D6478BD642FU, 0xE7037ED1A0B428DBU, 0x8EBC6AF09C88C6E3U,
                                             0x589965CC75374CC3U};

// NOLINTNEXTLINE(modernize-use-using): only a typedef can be marked as an extension.
__extension__ typedef unsigned __int128 Wide;

/// Multiplies and folds the product: every bit of both factors reaches the result.
[[nodiscard]] inline std::uint64_t mix(std::uint64_t one, std::uint64_t other) noexcept {
  const Wide product = static_cast<Wide>(one) * other;
  return static_cast<std::uint64_t>(product) ^ static_cast<std::uint64_t>(product >> 64);
}

}  // namespace detail

/// Both factors of each product contain the secret: otherwise a block could make one of them zero.
[[nodiscard]] inline std::uint64_t hashBlock(const HashedBlock& block, std::uint64_t secret) noexcept {
  using detail::kHashFactors;
  const std::uint64_t turned = std::rotl(secret, 32);
  return detail::mix(block[0] ^ kHashFactors[0] ^ secret, block[1] ^ kHashFactors[1] ^ turned) ^
         detail::mix(block[2] ^ kHashFactors[2] ^ secret, block[3] ^ kHashFactors[3] ^ turned);
}

[[nodiscard]] std::uint64_t hashText(std::string_view text, std::uint64_t secret) noexcept;

/// Returns a random number that is constant during the life of the process.
[[nodiscard]] std::uint64_t secretOfProcess() noexcept;

/// Hash function for standard containers with text keys.
struct SeededHash {
  [[nodiscard]] std::size_t operator()(std::string_view text) const noexcept {
    return static_cast<std::size_t>(hashText(text, secretOfProcess()));
  }
};

}  // namespace appsync
