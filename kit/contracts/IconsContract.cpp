#include "kit/contracts/IconsContract.h"

#include <string_view>
#include <thread>

#include "base/Bytes.h"
#include "kit/fakes/Threads.h"

namespace appsync::test {

GTEST_ALLOW_UNINSTANTIATED_PARAMETERIZED_TEST(IconsContract);

namespace {

bool isPicture(const Bytes& bytes) {
  constexpr std::string_view kSignature = "\x89PNG\r\n\x1a\n";
  return bytes.size() > kSignature.size() && textOf(bytes).starts_with(kSignature);
}

Bytes encoded(platform::PNGEncoders& encoders, const platform::Image& image) {
  Bytes destination;
  const auto encoder = encoders.createEncoder(destination, 1);
  if (encoder == nullptr) return {};
  encoder->addImage(image);
  return encoder->finalize() ? destination : Bytes();
}

}  // namespace

TEST_P(IconsContract, RendersAnAppsIcon) {
  EXPECT_NE(iconOf(IconKind::usable), nullptr);
}

TEST_P(IconsContract, UnusableIconReturnsNull) {
  EXPECT_EQ(iconOf(IconKind::damaged), nullptr);
  EXPECT_EQ(iconOf(IconKind::missingFile), nullptr);
  EXPECT_EQ(iconOf(IconKind::notNamed), nullptr);
}

TEST_P(IconsContract, ImageCanOutliveItsBundle) {
  auto bundle = subject().makeApp(IconKind::usable);
  const auto image = subject().renderer().createHomeScreenIconImage(*bundle);
  bundle.reset();
  ASSERT_NE(image, nullptr);
  EXPECT_TRUE(isPicture(encoded(subject().encoders(), *image)));
}

TEST_P(IconsContract, EncodesAnImage) {
  const auto image = iconOf(IconKind::usable);
  ASSERT_NE(image, nullptr);
  EXPECT_TRUE(isPicture(encoded(subject().encoders(), *image)));
}

TEST_P(IconsContract, EncodesEqualImagesEqually) {
  const auto image = iconOf(IconKind::usable);
  ASSERT_NE(image, nullptr);
  EXPECT_EQ(encoded(subject().encoders(), *image), encoded(subject().encoders(), *image));
}

TEST_P(IconsContract, ImageIsNeededDuringAddOnly) {
  auto image = iconOf(IconKind::usable);
  ASSERT_NE(image, nullptr);
  Bytes destination;
  const auto encoder = subject().encoders().createEncoder(destination, 1);
  ASSERT_NE(encoder, nullptr);
  encoder->addImage(*image);
  image.reset();
  EXPECT_TRUE(encoder->finalize());
  EXPECT_TRUE(isPicture(destination));
}

TEST_P(IconsContract, EncodingWithoutItsImageFails) {
  Bytes destination;
  const auto encoder = subject().encoders().createEncoder(destination, 1);
  ASSERT_NE(encoder, nullptr);
  EXPECT_FALSE(encoder->finalize());
}

TEST_P(IconsContract, EncodingCanBeAbandoned) {
  const auto image = iconOf(IconKind::usable);
  ASSERT_NE(image, nullptr);
  Bytes destination;
  auto encoder = subject().encoders().createEncoder(destination, 1);
  ASSERT_NE(encoder, nullptr);
  encoder->addImage(*image);
  encoder.reset();
}

TEST_P(IconsContract, RendersAndEncodesConcurrently) {
  const auto image = iconOf(IconKind::usable);
  ASSERT_NE(image, nullptr);
  const auto bundle = subject().makeApp(IconKind::usable);
  runOnThreads(6, [&](std::size_t) {
    EXPECT_TRUE(isPicture(encoded(subject().encoders(), *image)));
    EXPECT_NE(subject().renderer().createHomeScreenIconImage(*bundle), nullptr);
  });
}

}  // namespace appsync::test
