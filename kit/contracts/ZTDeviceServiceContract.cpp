#include "kit/contracts/ZTDeviceServiceContract.h"

#include "kit/contracts/EventCounter.h"
#include "kit/fakes/Threads.h"

namespace appsync::test {

GTEST_ALLOW_UNINSTANTIATED_PARAMETERIZED_TEST(ZTDeviceServiceContract);

std::shared_ptr<platform::ZTAsset> ZTDeviceServiceContract::asset(std::string_view identifier) {
  return std::make_shared<platform::ZTAsset>(std::string(identifier), "Application", std::nullopt);
}

TEST_P(ZTDeviceServiceContract, SupportDoesNotChange) {
  const bool prioritizes = service().supports(Operation::prioritizeAsset);
  const bool cancels = service().supports(Operation::cancelAssetTransferForFailedAsset);
  runOnThreads(4, [&](std::size_t) {
    EXPECT_EQ(service().supports(Operation::prioritizeAsset), prioritizes);
    EXPECT_EQ(service().supports(Operation::cancelAssetTransferForFailedAsset), cancels);
  });
}

TEST_P(ZTDeviceServiceContract, PrioritizingAnUnknownAssetCompletesOnce) {
  if (!service().supports(Operation::prioritizeAsset)) GTEST_SKIP() << "the subject does not support the operation";
  EventCounter completions;
  service().prioritizeAsset(asset("com.a"), [&](const std::optional<Error>&) { completions.add(); });
  EXPECT_TRUE(completions.waitFor(1));
  service().prioritizeAsset(asset("com.a"), [&](const std::optional<Error>&) { completions.add(); });
  EXPECT_TRUE(completions.waitFor(2));
  EXPECT_EQ(completions.count(), 2U);
}

TEST_P(ZTDeviceServiceContract, PrioritizingCompletesBeforeTheServiceEnds) {
  if (!service().supports(Operation::prioritizeAsset)) GTEST_SKIP() << "the subject does not support the operation";
  EventCounter completions;
  auto another = GetParam().make();
  another->service().prioritizeAsset(asset("com.a"), [&](const std::optional<Error>&) { completions.add(); });
  another.reset();
  EXPECT_EQ(completions.count(), 1U);
}

TEST_P(ZTDeviceServiceContract, CancellingAnUnknownAssetDoesNothing) {
  if (!service().supports(Operation::cancelAssetTransferForFailedAsset))
    GTEST_SKIP() << "the subject does not support the operation";
  service().cancelAssetTransferForFailedAsset(asset("com.a"));
  service().cancelAssetTransferForFailedAsset(asset("com.a"));
  EXPECT_TRUE(service().supports(Operation::cancelAssetTransferForFailedAsset));
}

TEST_P(ZTDeviceServiceContract, CompletionCanCallTheService) {
  if (!service().supports(Operation::prioritizeAsset)) GTEST_SKIP() << "the subject does not support the operation";
  EventCounter completions;
  service().prioritizeAsset(asset("com.a"), [&](const std::optional<Error>&) {
    service().prioritizeAsset(asset("com.b"), [&](const std::optional<Error>&) { completions.add(); });
  });
  EXPECT_TRUE(completions.waitFor(1));
}

TEST_P(ZTDeviceServiceContract, IsThreadSafe) {
  const bool prioritizes = service().supports(Operation::prioritizeAsset);
  const bool cancels = service().supports(Operation::cancelAssetTransferForFailedAsset);
  EventCounter completions;
  runOnThreads(4, [&](std::size_t index) {
    for (int round = 0; round < 10; ++round) {
      const auto wanted = asset("com.app" + std::to_string(index));
      if (prioritizes) {
        service().prioritizeAsset(wanted, [&](const std::optional<Error>&) { completions.add(); });
      }
      if (cancels) service().cancelAssetTransferForFailedAsset(wanted);
    }
  });
  EXPECT_TRUE(completions.waitFor(prioritizes ? 40 : 0));
}

}  // namespace appsync::test
