#include <cstdint>
#include <limits>

#include <gtest/gtest.h>

#include "device/BackupManager.h"
#include "tests/device/ServiceDatabase.h"

namespace appsync::test {
namespace {

using device::BackupManager;

class BackupManagerTest : public testing::Test {
 protected:
  ServiceDatabase<BackupManager> database;
  BackupManager manager{database};
  std::uint64_t size = 7;
};

TEST_F(BackupManagerTest, AnAppWithoutDataHasNoneAndLeavesTheSizeAlone) {
  EXPECT_FALSE(manager.restoreDataExists("com.a", &size));
  EXPECT_EQ(size, 7U);
}

TEST_F(BackupManagerTest, KeptDataExistsWithItsSize) {
  EXPECT_TRUE(manager.keepRestoreData("com.a", 123));
  EXPECT_TRUE(manager.restoreDataExists("com.a", &size));
  EXPECT_EQ(size, 123U);
  EXPECT_FALSE(manager.restoreDataExists("com.b", &size));
}

TEST_F(BackupManagerTest, TheSizeNeedNotBeAskedFor) {
  EXPECT_TRUE(manager.keepRestoreData("com.a", 1));
  EXPECT_TRUE(manager.restoreDataExists("com.a", nullptr));
}

TEST_F(BackupManagerTest, EverySizeIsKept) {
  EXPECT_TRUE(manager.keepRestoreData("com.a", std::numeric_limits<std::uint64_t>::max()));
  EXPECT_TRUE(manager.restoreDataExists("com.a", &size));
  EXPECT_EQ(size, std::numeric_limits<std::uint64_t>::max());
}

TEST_F(BackupManagerTest, AllConnectionsSeeTheSameAndItOutlivesTheProcess) {
  EXPECT_TRUE(manager.keepRestoreData("com.a", 5));
  EXPECT_TRUE(BackupManager(database).restoreDataExists("com.a", nullptr));
  database.reopen();
  EXPECT_TRUE(BackupManager(database).restoreDataExists("com.a", &size));
  EXPECT_EQ(size, 5U);
}

TEST_F(BackupManagerTest, CancellingARestoreDropsTheAppsData) {
  EXPECT_TRUE(manager.keepRestoreData("com.a", 5));
  EXPECT_TRUE(manager.keepRestoreData("com.b", 6));
  std::optional<Error> error;
  EXPECT_TRUE(manager.cancelApplicationRestore("com.a", &error));
  EXPECT_EQ(error, std::nullopt);
  EXPECT_FALSE(manager.restoreDataExists("com.a", nullptr));
  EXPECT_TRUE(manager.restoreDataExists("com.b", nullptr));
}

TEST_F(BackupManagerTest, CancellingWithoutDataIsASuccess) {
  EXPECT_TRUE(manager.cancelApplicationRestore("com.a", nullptr));
}

TEST_F(BackupManagerTest, AFailedCancellationSaysWhy) {
  database.drop("restore_data");
  std::optional<Error> error;
  EXPECT_FALSE(manager.cancelApplicationRestore("com.a", &error));
  ASSERT_TRUE(error);
  EXPECT_EQ(error->domain, device::kSQLiteDomain);
  EXPECT_FALSE(manager.cancelApplicationRestore("com.a", nullptr));
  EXPECT_FALSE(manager.restoreDataExists("com.a", &size));
  EXPECT_EQ(size, 7U);
}

}  // namespace
}  // namespace appsync::test
