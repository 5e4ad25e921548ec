#include "kit/contracts/BackupManagerContract.h"

#include <optional>
#include <string>

#include "kit/fakes/Threads.h"

namespace appsync::test {

GTEST_ALLOW_UNINSTANTIATED_PARAMETERIZED_TEST(BackupManagerContract);

TEST_P(BackupManagerContract, AppWithoutDataHasNoRestoreData) {
  subject().keepRestoreData("com.other", 5);
  EXPECT_FALSE(manager->restoreDataExists("com.a", nullptr));
}

TEST_P(BackupManagerContract, ReturnsTheSizeOfTheData) {
  subject().keepRestoreData("com.a", 5'000'000'000);
  std::uint64_t size = 0;
  EXPECT_TRUE(manager->restoreDataExists("com.a", &size));
  EXPECT_EQ(size, 5'000'000'000U);
}

TEST_P(BackupManagerContract, AcceptsNullSize) {
  subject().keepRestoreData("com.a", 5);
  EXPECT_TRUE(manager->restoreDataExists("com.a", nullptr));
}

TEST_P(BackupManagerContract, IdentifiersAreComparedExactly) {
  subject().keepRestoreData("com.a", 5);
  EXPECT_FALSE(manager->restoreDataExists("com.A", nullptr));
  EXPECT_FALSE(manager->restoreDataExists("com", nullptr));
  EXPECT_FALSE(manager->restoreDataExists("", nullptr));
}

TEST_P(BackupManagerContract, CancellingDeletesTheAppsData) {
  subject().keepRestoreData("com.a", 5);
  subject().keepRestoreData("com.b", 5);
  std::optional<Error> error;
  EXPECT_TRUE(manager->cancelApplicationRestore("com.a", &error));
  EXPECT_FALSE(error);
  EXPECT_FALSE(manager->restoreDataExists("com.a", nullptr));
  EXPECT_TRUE(manager->restoreDataExists("com.b", nullptr));
}

TEST_P(BackupManagerContract, CancellingWithoutDataSucceeds) {
  EXPECT_TRUE(manager->cancelApplicationRestore("com.a", nullptr));
}

TEST_P(BackupManagerContract, AcceptsNullErrorSlot) {
  subject().keepRestoreData("com.a", 5);
  EXPECT_TRUE(manager->cancelApplicationRestore("com.a", nullptr));
}

TEST_P(BackupManagerContract, FailedCancellationSetsErrorAndKeepsData) {
  subject().keepRestoreData("com.a", 5);
  if (!subject().failCancelling()) GTEST_SKIP() << "the subject cannot fail cancellations";
  std::optional<Error> error;
  EXPECT_FALSE(manager->cancelApplicationRestore("com.a", &error));
  ASSERT_TRUE(error);
  EXPECT_FALSE(error->domain.empty());
  EXPECT_FALSE(manager->cancelApplicationRestore("com.a", nullptr));
  EXPECT_TRUE(manager->restoreDataExists("com.a", nullptr));
}

TEST_P(BackupManagerContract, ConnectionsShareTheirData) {
  subject().keepRestoreData("com.a", 5);
  const auto other = subject().makeManager();
  ASSERT_NE(other, nullptr);
  EXPECT_TRUE(other->cancelApplicationRestore("com.a", nullptr));
  EXPECT_FALSE(manager->restoreDataExists("com.a", nullptr));
}

TEST_P(BackupManagerContract, ConnectionIsThreadSafe) {
  constexpr std::size_t kThreads = 8;
  for (std::size_t index = 0; index < kThreads; ++index)
    subject().keepRestoreData("com.a" + std::to_string(index), 1);
  runOnThreads(kThreads, [&](std::size_t index) {
    const std::string identifier = "com.a" + std::to_string(index);
    EXPECT_TRUE(manager->restoreDataExists(identifier, nullptr));
    EXPECT_TRUE(manager->cancelApplicationRestore(identifier, nullptr));
    EXPECT_FALSE(manager->restoreDataExists(identifier, nullptr));
  });
}

}  // namespace appsync::test
