// What walks over installed apps hold: one app at a time, however many there are.
#include <cstddef>
#include <cstdint>
#include <functional>

#include <gtest/gtest.h>

#include "core/AppsClient.h"
#include "kit/fakes/SyncFileBuilder.h"
#include "tests/support/HeldMemory.h"
#include "tests/support/ManyApps.h"

namespace appsync::test {
namespace {

using Operation = std::function<void(AppsClient& client)>;

constexpr std::size_t kLongText = 10'000;

/// Metadata that is large next to all else that an operation holds, and that a backup has to rewrite.
Bytes largeMetadata() {
  return binaryForm(plist::Dictionary{
      {"corvelId", "a@example.org"}, {"DeviceBasedKLP", true}, {"title", std::string(kLongText, 'x')}});
}

/// The peak of one operation over that many apps.
std::size_t mostHeldBy(const Operation& operation, std::int64_t apps) {
  DeviceOfManyApps device(apps, largeMetadata());
  const auto client = AppsClient::create(device.platform);
  return memory::mostHeldDuring([&] { operation(*client); });
}

void expectSamePeak(const Operation& operation, std::size_t atLeast, std::size_t atMost) {
  const std::size_t few = mostHeldBy(operation, 20);
  EXPECT_EQ(mostHeldBy(operation, 200), few);
  EXPECT_GE(few, atLeast);
  EXPECT_LE(few, atMost);
}

TEST(ReportMemory, MetricsHoldOneRecord) {
  expectSamePeak([](AppsClient& client) { static_cast<void>(client.installedAssetMetrics()); }, 1, 1000);
}

TEST(ReportMemory, IdentifiersHoldOneAppsMetadata) {
  expectSamePeak([](AppsClient& client) { static_cast<void>(client.corvelIDsForAssets()); }, kLongText, 3 * kLongText);
}

TEST(ReportMemory, AccountsHoldOneAppsMetadata) {
  expectSamePeak([](AppsClient& client) { static_cast<void>(client.accountsForAssets()); }, kLongText, 3 * kLongText);
}

TEST(ReportMemory, PreparingABackupHoldsOneAppsMetadata) {
  expectSamePeak([](AppsClient& client) { client.prepareForBackup(); }, kLongText, 5 * kLongText);
}

}  // namespace
}  // namespace appsync::test
