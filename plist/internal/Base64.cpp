#include "plist/internal/Base64.h"

#include <array>
#include <cstdint>

namespace appsync::plist {

namespace {

constexpr std::string_view kAlphabet = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";

constexpr std::uint32_t kSpace = 0x1000000;
constexpr std::uint32_t kPadding = 0x2000000;
constexpr std::uint32_t kForeign = 0x4000000;
/// Set in the entry of every character that is not of the alphabet.
constexpr std::uint32_t kNoDigit = kSpace | kPadding | kForeign;

using Digits = std::array<std::uint32_t, 256>;

/// For each character its six bits, where they belong in a group of 24.
constexpr Digits digitsShiftedBy(unsigned shift) {
  Digits digits{};
  digits.fill(kForeign);
  for (std::uint32_t i = 0; i < kAlphabet.size(); ++i)
    digits[static_cast<unsigned char>(kAlphabet[i])] = i << shift;
  for (const char space : std::string_view(" \t\r\n"))
    digits[static_cast<unsigned char>(space)] = kSpace;
  digits['='] = kPadding;
  return digits;
}

constexpr std::array<Digits, 4> kDigits = {digitsShiftedBy(18), digitsShiftedBy(12), digitsShiftedBy(6),
                                           digitsShiftedBy(0)};

/// All pairs of characters, for each twelve bits.
constexpr auto kPairs = [] {
  std::array<std::array<char, 2>, 4096> pairs{};
  for (std::size_t i = 0; i < pairs.size(); ++i)
    pairs[i] = {kAlphabet[i >> 6], kAlphabet[i & 63]};
  return pairs;
}();

std::uint32_t group(const unsigned char* at) noexcept {
  return kDigits[0][at[0]] | kDigits[1][at[1]] | kDigits[2][at[2]] | kDigits[3][at[3]];
}

std::byte* writeBytes(std::uint32_t bits, unsigned count, std::byte* out) noexcept {
  for (unsigned i = 0; i < count; ++i)
    *out++ = static_cast<std::byte>(bits >> (16 - 8 * i));
  return out;
}

/// The slow way around white space and padding: one group at a time.
class GroupReader {
 public:
  enum class Outcome { group, end, error };

  /// Reads up to four characters of the alphabet from `at`, which then points past them or at the offender.
  Outcome read(const unsigned char*& at, const unsigned char* end) noexcept {
    bits = 0;
    digits = 0;
    unsigned padding = 0;
    for (; at != end && digits + padding < 4; ++at) {
      const std::uint32_t entry = kDigits[3][*at];
      if (entry == kSpace) continue;
      const bool isMisplaced = entry == kPadding ? digits < 2 : padding > 0;
      if (entry == kForeign || isMisplaced) return Outcome::error;
      if (entry == kPadding) {
        ++padding;
      } else {
        bits |= entry << (18 - 6 * digits++);
      }
    }
    if (digits == 0) return Outcome::end;
    return digits + padding == 4 ? Outcome::group : Outcome::error;
  }

  std::uint32_t bits = 0;
  unsigned digits = 0;
};

}  // namespace

char* writeBase64(ByteView bytes, char* out) noexcept {
  const auto* at = reinterpret_cast<const unsigned char*>(bytes.data());
  std::size_t left = bytes.size();
  const auto writePair = [&](std::uint32_t twelveBits) {
    const auto& pair = kPairs[twelveBits];
    out[0] = pair[0];
    out[1] = pair[1];
    out += 2;
  };
  for (; left >= 3; left -= 3, at += 3) {
    const auto bits = static_cast<std::uint32_t>(at[0] << 16 | at[1] << 8 | at[2]);
    writePair(bits >> 12);
    writePair(bits & 0xFFF);
  }
  if (left == 0) return out;
  const auto bits = static_cast<std::uint32_t>(at[0] << 16 | (left == 2 ? at[1] << 8 : 0));
  writePair(bits >> 12);
  writePair(bits & 0xFFF);
  if (left == 1) out[-2] = '=';
  out[-1] = '=';
  return out;
}

std::optional<std::size_t> decodeBase64(std::string_view text, Bytes& bytes) {
  bytes.resize(text.size() / 4 * 3 + 3);
  const auto* const begin = reinterpret_cast<const unsigned char*>(text.data());
  const unsigned char* at = begin;
  const unsigned char* const end = begin + text.size();
  std::byte* out = bytes.data();
  GroupReader reader;
  for (bool isPadded = false;;) {
    while (!isPadded && end - at >= 4) {
      const std::uint32_t bits = group(at);
      if ((bits & kNoDigit) != 0) break;
      out = writeBytes(bits, 3, out);
      at += 4;
    }
    const auto outcome = reader.read(at, end);
    if (outcome == GroupReader::Outcome::end) break;
    if (outcome == GroupReader::Outcome::error || isPadded) return static_cast<std::size_t>(at - begin);
    out = writeBytes(reader.bits, reader.digits - 1, out);
    isPadded = reader.digits < 4;
  }
  bytes.resize(static_cast<std::size_t>(out - bytes.data()));
  return std::nullopt;
}

}  // namespace appsync::plist
