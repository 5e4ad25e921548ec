#include <memory>

#include <gtest/gtest-spi.h>
#include <gtest/gtest.h>

#include "kit/fakes/FakeDeviceService.h"

namespace appsync::test {

using Operation = platform::ZTDeviceService::Operation;

namespace {

class FakeDeviceServiceTest : public testing::Test {
 protected:
  void prioritize() {
    service.prioritizeAsset(asset, [this](const std::optional<Error>& error) {
      ++completions;
      outcome = error;
    });
  }

  const std::shared_ptr<platform::ZTAsset> asset =
      std::make_shared<platform::ZTAsset>("com.a", "Application", std::nullopt);
  CallJournal journal;
  FakeDeviceService service{journal};
  int completions = 0;
  std::optional<Error> outcome;
};

}  // namespace

TEST_F(FakeDeviceServiceTest, OperationsCanBeDisabled) {
  EXPECT_TRUE(service.supports(Operation::prioritizeAsset));
  EXPECT_TRUE(service.supports(Operation::cancelAssetTransferForFailedAsset));
  service.stopSupporting(Operation::prioritizeAsset);
  EXPECT_FALSE(service.supports(Operation::prioritizeAsset));
  EXPECT_TRUE(service.supports(Operation::cancelAssetTransferForFailedAsset));
  EXPECT_NONFATAL_FAILURE(prioritize(), "prioritizeAsset is not supported");
}

TEST_F(FakeDeviceServiceTest, PrioritizingCompletesAtOnceOrOnRequest) {
  prioritize();
  EXPECT_EQ(completions, 1);
  service.holdCompletions();
  service.failPrioritizing(Error{"ZTError", 7, "busy", nullptr});
  prioritize();
  EXPECT_EQ(completions, 1);
  service.complete();
  service.complete();
  EXPECT_EQ(completions, 2);
  EXPECT_EQ(outcome->code, 7);
}

TEST_F(FakeDeviceServiceTest, JournalsCallsAndFailsByTheHook) {
  service.cancelAssetTransferForFailedAsset(asset);
  journal.failCall(1, Error{"ZTError", 9, {}, nullptr});
  prioritize();
  EXPECT_EQ(outcome->code, 9);
  EXPECT_TRUE(service.supports(Operation::prioritizeAsset));
  EXPECT_EQ(journal.lines(), (std::vector<std::string>{"deviceService.cancelAssetTransferForFailedAsset com.a",
                                                       "deviceService.prioritizeAsset com.a",
                                                       "deviceService.supports prioritizeAsset"}));
}

}  // namespace appsync::test
