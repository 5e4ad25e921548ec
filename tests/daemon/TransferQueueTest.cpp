#include <optional>
#include <string>
#include <thread>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "daemon/TransferQueue.h"

namespace appsync::daemon {
namespace {

using platform::ZTAsset;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using Strings = std::vector<std::string>;

std::shared_ptr<ZTAsset> asset(const std::string& identifier) {
  return std::make_shared<ZTAsset>(identifier, "Application", std::nullopt);
}

class TransferQueueTest : public testing::Test {
 protected:
  void fill(const Strings& identifiers) {
    platform::Assets assets;
    for (const std::string& identifier : identifiers)
      assets.push_back(asset(identifier));
    queue_.fill(assets);
  }
  /// Returns the error that the completion received.
  std::optional<Error> prioritize(const std::string& identifier) {
    std::optional<std::optional<Error>> answer;
    queue_.prioritizeAsset(asset(identifier), [&](const std::optional<Error>& error) {
      EXPECT_FALSE(answer) << "completed twice";
      answer.emplace(error);
    });
    EXPECT_TRUE(answer) << "never completed";
    return answer.value_or(std::nullopt);
  }
  void cancel(const std::string& identifier) { queue_.cancelAssetTransferForFailedAsset(asset(identifier)); }
  Strings rest() {
    Strings identifiers;
    while (const auto next = queue_.take())
      identifiers.push_back(next->identifier());
    return identifiers;
  }

  TransferQueue queue_;
};

TEST_F(TransferQueueTest, KeepsTheClientsOrder) {
  fill({"a", "b", "c"});
  EXPECT_EQ(queue_.front()->identifier(), "a");
  EXPECT_THAT(rest(), ElementsAre("a", "b", "c"));
  EXPECT_EQ(queue_.front(), nullptr);
}

TEST_F(TransferQueueTest, MovesPrioritisedPackageToFront) {
  fill({"a", "b", "c", "d"});
  EXPECT_EQ(queue_.take()->identifier(), "a");
  EXPECT_EQ(prioritize("c"), std::nullopt);
  EXPECT_THAT(rest(), ElementsAre("c", "b", "d"));
}

TEST_F(TransferQueueTest, LatestPriorityIsFirst) {
  fill({"a", "b", "c", "d"});
  EXPECT_EQ(prioritize("c"), std::nullopt);
  EXPECT_EQ(prioritize("d"), std::nullopt);
  EXPECT_THAT(rest(), ElementsAre("d", "c", "a", "b"));
}

TEST_F(TransferQueueTest, AppliesPrioritiesFromBeforeFill) {
  EXPECT_EQ(prioritize("b"), std::nullopt);
  EXPECT_EQ(prioritize("c"), std::nullopt);
  EXPECT_EQ(prioritize("unknown"), std::nullopt);
  cancel("a");
  fill({"a", "b", "c", "d"});
  EXPECT_THAT(rest(), ElementsAre("c", "b", "d"));
}

TEST_F(TransferQueueTest, FailsToPrioritiseTakenPackage) {
  fill({"a", "b"});
  ASSERT_NE(queue_.take(), nullptr);
  const std::optional<Error> error = prioritize("a");
  ASSERT_TRUE(error);
  EXPECT_THAT(error->text, HasSubstr("a is not among the packages that are still to be sent"));
  EXPECT_THAT(rest(), ElementsAre("b"));
}

TEST_F(TransferQueueTest, DropsCancelledPackage) {
  fill({"a", "b", "c"});
  cancel("b");
  cancel("unknown");
  EXPECT_TRUE(queue_.wasCancelled("b"));
  EXPECT_FALSE(queue_.wasCancelled("a"));
  EXPECT_THAT(rest(), ElementsAre("a", "c"));
}

TEST_F(TransferQueueTest, KnowsCancelledTakenPackage) {
  fill({"a"});
  ASSERT_NE(queue_.take(), nullptr);
  EXPECT_FALSE(queue_.wasCancelled("a"));
  cancel("a");
  EXPECT_TRUE(queue_.wasCancelled("a"));
}

TEST_F(TransferQueueTest, FailsToPrioritiseCancelledPackage) {
  fill({"a", "b"});
  cancel("b");
  EXPECT_TRUE(prioritize("b"));
  EXPECT_THAT(rest(), ElementsAre("a"));
}

TEST_F(TransferQueueTest, SupportsBothOperations) {
  EXPECT_TRUE(queue_.supports(TransferQueue::Operation::prioritizeAsset));
  EXPECT_TRUE(queue_.supports(TransferQueue::Operation::cancelAssetTransferForFailedAsset));
}

TEST_F(TransferQueueTest, IsThreadSafe) {
  Strings identifiers;
  for (int number = 0; number < 500; ++number)
    identifiers.push_back("app" + std::to_string(number));
  fill(identifiers);
  std::thread asking([&] {
    for (int number = 499; number >= 0; --number) {
      queue_.prioritizeAsset(asset("app" + std::to_string(number)), [](const std::optional<Error>&) {});
      if (number % 10 == 0) cancel("app" + std::to_string(number));
    }
  });
  Strings sent = rest();
  asking.join();
  std::ranges::sort(sent);
  EXPECT_TRUE(std::ranges::adjacent_find(sent) == sent.end());
  for (const std::string& identifier : identifiers)
    EXPECT_TRUE(std::ranges::binary_search(sent, identifier) || queue_.wasCancelled(identifier)) << identifier;
  EXPECT_THAT(rest(), IsEmpty());
}

}  // namespace
}  // namespace appsync::daemon
