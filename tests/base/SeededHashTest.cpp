#include <cstdint>
#include <set>
#include <string>

#include <gtest/gtest.h>

#include "base/SeededHash.h"

namespace appsync::test {
namespace {

constexpr int kMany = 1000;
constexpr std::uint64_t kSecret = 0x0123456789ABCDEF;

TEST(SeededHash, EqualTextsHaveOneHash) {
  for (const std::size_t length : {0U, 1U, 31U, 32U, 33U, 64U, 1000U}) {
    const std::string text(length, 'x');
    EXPECT_EQ(SeededHash()(text), SeededHash()(std::string(text)));
    EXPECT_EQ(hashText(text, kSecret), hashText(std::string(text), kSecret));
  }
}

TEST(SeededHash, LengthContentAndSecretDecide) {
  std::set<std::uint64_t> hashes;
  for (std::size_t length = 0; length < kMany; ++length)
    hashes.insert(hashText(std::string(length, '\0'), kSecret));
  EXPECT_EQ(hashes.size(), kMany);
  EXPECT_NE(hashText("com.a", kSecret), hashText("com.b", kSecret));
  EXPECT_NE(hashText("com.a", kSecret), hashText("com.a", kSecret + 1));
  EXPECT_NE(hashText("com.a", kSecret), hashText("com.a", kSecret + (std::uint64_t{1} << 32)));
}

/// Content that turns one factor of a product into zero for whoever knows the factors but not the secret.
TEST(SeededHash, EachPartOfABlockDecides) {
  for (const std::size_t fixed : {0U, 1U, 2U, 3U}) {
    std::set<std::uint64_t> hashes;
    for (std::uint64_t i = 0; i < kMany; ++i) {
      HashedBlock block{};
      block[fixed] = detail::kHashFactors[fixed];
      block[fixed ^ 1] = i;
      hashes.insert(hashBlock(block, kSecret));
    }
    EXPECT_EQ(hashes.size(), kMany) << fixed;
  }
}

TEST(SeededHash, TheProcessKeepsItsSecret) {
  EXPECT_EQ(secretOfProcess(), secretOfProcess());
  EXPECT_NE(secretOfProcess(), 0U);
}

}  // namespace
}  // namespace appsync::test
