#include "base/SeededHash.h"

#include <chrono>
#include <cstring>
#include <exception>
#include <random>

namespace appsync {

namespace {

std::uint64_t drawSecret() noexcept {
  try {
    std::random_device source;
    return std::uint64_t{source()} << 32 | source();
  } catch (const std::exception&) {  // No random device: use the randomised load address and the time.
    static const char place = 0;
    const auto now = static_cast<std::uint64_t>(std::chrono::steady_clock::now().time_since_epoch().count());
    return detail::mix(reinterpret_cast<std::uintptr_t>(&place), now | 1);
  }
}

}  // namespace

std::uint64_t secretOfProcess() noexcept {
  static const std::uint64_t secret = drawSecret();
  return secret;
}

std::uint64_t hashText(std::string_view text, std::uint64_t secret) noexcept {
  using detail::kHashFactors;
  HashedBlock block;
  std::uint64_t hash = detail::mix(text.size() ^ secret, kHashFactors[2]);
  for (; text.size() > sizeof block; text.remove_prefix(sizeof block)) {
    std::memcpy(block.data(), text.data(), sizeof block);
    hash = detail::mix(hashBlock(block, hash), kHashFactors[3]);
  }
  block = {};
  if (!text.empty()) std::memcpy(block.data(), text.data(), text.size());
  return hashBlock(block, hash);
}

}  // namespace appsync
