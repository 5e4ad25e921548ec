#include <cstdint>

#include <gtest/gtest.h>

#include "device/apps/BackupManager.h"
#include "tests/support/TestDevice.h"

namespace appsync::test {
namespace {

using device::BackupManager;

class BackupManagerTest : public testing::Test {
 protected:
  /// Creates a host directory with a file of `bytes` bytes.
  [[nodiscard]] std::string data(std::size_t bytes) {
    const std::string folder = folder_.path("data" + std::to_string(bytes));
    std::filesystem::create_directories(folder + "/Documents");
    writeHostFile(folder + "/Documents/notes", std::string(bytes, 'n'));
    return folder;
  }
  [[nodiscard]] std::string keptFile(std::string_view identifier) const {
    return device_.host(device::kRestoreDataPath) + "/" + std::string(identifier) + "/Documents/notes";
  }
  [[nodiscard]] std::string dataFile(std::string_view identifier) const {
    return device_.host(device::dataContainerOf(identifier)) + "/Documents/notes";
  }

  TemporaryFolder folder_;
  TestDevice device_;
  BackupManager manager{device_.services().database(), device_.files()};
  std::uint64_t size = 7;
};

TEST_F(BackupManagerTest, MissingDataLeavesSizeUnchanged) {
  EXPECT_FALSE(manager.restoreDataExists("com.a", &size));
  EXPECT_EQ(size, 7U);
}

TEST_F(BackupManagerTest, ReportsSizeOfKeptData) {
  EXPECT_TRUE(manager.keepRestoreData("com.a", data(123)));
  EXPECT_TRUE(manager.restoreDataExists("com.a", &size));
  EXPECT_EQ(size, 123U);
  EXPECT_EQ(readHostFile(keptFile("com.a")), std::string(123, 'n'));
  EXPECT_FALSE(manager.restoreDataExists("com.b", &size));
}

TEST_F(BackupManagerTest, ReplacesKeptData) {
  EXPECT_TRUE(manager.keepRestoreData("com.a", data(5)));
  EXPECT_TRUE(manager.keepRestoreData("com.a", data(6)));
  EXPECT_TRUE(manager.restoreDataExists("com.a", &size));
  EXPECT_EQ(size, 6U);
  EXPECT_EQ(readHostFile(keptFile("com.a")), std::string(6, 'n'));
}

TEST_F(BackupManagerTest, KeptDataSurvivesRestart) {
  EXPECT_TRUE(manager.keepRestoreData("com.a", data(5)));
  EXPECT_TRUE(device_.services().makeBackupManager()->restoreDataExists("com.a", nullptr));
  device_.reopen();
  EXPECT_TRUE(device_.services().makeBackupManager()->restoreDataExists("com.a", &size));
  EXPECT_EQ(size, 5U);
  EXPECT_EQ(readHostFile(keptFile("com.a")), std::string(5, 'n'));
}

TEST_F(BackupManagerTest, CancellationDeletesDataOfApp) {
  EXPECT_TRUE(manager.keepRestoreData("com.a", data(5)));
  EXPECT_TRUE(manager.keepRestoreData("com.b", data(6)));
  std::optional<Error> error;
  EXPECT_TRUE(manager.cancelApplicationRestore("com.a", &error));
  EXPECT_EQ(error, std::nullopt);
  EXPECT_FALSE(manager.restoreDataExists("com.a", nullptr));
  EXPECT_FALSE(std::filesystem::exists(keptFile("com.a")));
  EXPECT_TRUE(manager.restoreDataExists("com.b", nullptr));
  EXPECT_TRUE(device_.isTidy());
}

TEST_F(BackupManagerTest, RejectsInvalidIdentifiers) {
  for (const char* identifier : {"..", "../x", "a/b", ""}) {
    EXPECT_FALSE(manager.keepRestoreData(identifier, data(5))) << identifier;
    EXPECT_TRUE(manager.cancelApplicationRestore(identifier, nullptr)) << identifier;
  }
  EXPECT_TRUE(std::filesystem::exists(device_.host("/var/mobile/Library")));
}

TEST_F(BackupManagerTest, RejectsFilesAndMissingDirectories) {
  EXPECT_FALSE(manager.keepRestoreData("com.a", folder_.path("missing")));
  writeHostFile(folder_.path("file"), "x");
  EXPECT_FALSE(manager.keepRestoreData("com.a", folder_.path("file")));
  EXPECT_FALSE(manager.restoreDataExists("com.a", nullptr));
  EXPECT_TRUE(device_.isTidy());
}

TEST_F(BackupManagerTest, InstallReplacesDataByKeptData) {
  device_.install("com.a");
  std::filesystem::create_directories(device_.host(device::dataContainerOf("com.a")));
  writeHostFile(device_.host(device::dataContainerOf("com.a")) + "/old", "old");
  EXPECT_TRUE(manager.keepRestoreData("com.a", data(9)));
  device_.install("com.a", "2.0");
  EXPECT_EQ(readHostFile(dataFile("com.a")), std::string(9, 'n'));
  EXPECT_FALSE(std::filesystem::exists(device_.host(device::dataContainerOf("com.a")) + "/old"));
  EXPECT_FALSE(manager.restoreDataExists("com.a", nullptr));
  EXPECT_EQ(TestDevice::entriesIn(device_.host(device::kRestoreDataPath)), 0);
}

TEST_F(BackupManagerTest, PlaceholderLeavesDataKept) {
  EXPECT_TRUE(manager.keepRestoreData("com.a", data(9)));
  device_.placeholder("com.a", platform::TSInstallType::Restore);
  EXPECT_TRUE(manager.restoreDataExists("com.a", nullptr));
  EXPECT_FALSE(std::filesystem::exists(dataFile("com.a")));
}

TEST_F(BackupManagerTest, RestoresDataOfDemotedAppNow) {
  EXPECT_TRUE(manager.keepRestoreData("com.a", data(9)));
  EXPECT_TRUE(manager.restoreDataNow("com.a"));
  EXPECT_EQ(readHostFile(dataFile("com.a")), std::string(9, 'n'));
  EXPECT_FALSE(manager.restoreDataExists("com.a", nullptr));
  EXPECT_TRUE(manager.restoreDataNow("com.a"));
  EXPECT_EQ(readHostFile(dataFile("com.a")), std::string(9, 'n'));
}

TEST_F(BackupManagerTest, UpdateKeepsAndRemovalDeletesData) {
  device_.install("com.a");
  std::filesystem::create_directories(device_.host(device::dataContainerOf("com.a")));
  device_.install("com.a", "2.0");
  EXPECT_TRUE(std::filesystem::exists(device_.host(device::dataContainerOf("com.a"))));
  EXPECT_TRUE(manager.keepRestoreData("com.a", data(9)));
  EXPECT_TRUE(device_.registry().uninstallApplication("com.a"));
  EXPECT_FALSE(std::filesystem::exists(device_.host(device::dataContainerOf("com.a"))));
  EXPECT_FALSE(std::filesystem::exists(keptFile("com.a")));
  EXPECT_FALSE(manager.restoreDataExists("com.a", nullptr));
}

TEST_F(BackupManagerTest, PlaceholderRemovalKeepsData) {
  EXPECT_TRUE(manager.keepRestoreData("com.a", data(9)));
  device_.placeholder("com.a", platform::TSInstallType::Restore);
  EXPECT_TRUE(device_.registry().uninstallApplication("com.a", {{platform::kUninstallPlaceholdersOnlyKey, true}}));
  EXPECT_TRUE(manager.restoreDataExists("com.a", nullptr));
}

TEST_F(BackupManagerTest, RemovalOfPlaceholderOverAppKeepsData) {
  device_.install("com.a");
  const std::string container = device_.host(device::dataContainerOf("com.a"));
  std::filesystem::create_directories(container);
  EXPECT_TRUE(manager.keepRestoreData("com.a", data(9)));
  device_.placeholder("com.a");
  EXPECT_TRUE(device_.registry().uninstallApplication("com.a"));
  EXPECT_TRUE(std::filesystem::exists(container));
  EXPECT_TRUE(manager.restoreDataExists("com.a", nullptr));
}

TEST_F(BackupManagerTest, FailedCancellationReportsError) {
  {
    device::Database::Session session(device_.services().database());
    EXPECT_TRUE(session.runScript("drop table restore_data"));
  }
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
