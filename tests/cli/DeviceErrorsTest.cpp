// Devices that cannot be used.
#include <gmock/gmock.h>
#include <sys/mount.h>
#include <unistd.h>

#include "device/storage/Database.h"
#include "tests/support/ToolFixture.h"

namespace appsync::test {

namespace {

using testing::HasSubstr;
using testing::StartsWith;

class DeviceErrors : public ToolFixture {
 protected:
  static void expectUnusable(const Finished& run, const std::string& reason) {
    EXPECT_EQ(run.status, 3);
    EXPECT_EQ(run.out, "");
    EXPECT_THAT(run.err, StartsWith("appsync: "));
    EXPECT_THAT(run.err, HasSubstr(reason));
    EXPECT_EQ(std::ranges::count(run.err, '\n'), 1);
  }
};

TEST_F(DeviceErrors, MissingDeviceNamesInit) {
  expectUnusable(runTool({"sync", path("nowhere"), library()}), "appsync init");
}

TEST_F(DeviceErrors, RefusesOtherFolder) {
  expectUnusable(runTool({"apps", library()}), "is not a device");
}

TEST_F(DeviceErrors, ReportsDamagedDatabase) {
  for (const char* file : {"/device.db", "/device.db-wal", "/device.db-shm"}) {
    if (std::filesystem::exists(device() + file)) write(device() + file, std::string(8192, 'x'));
  }
  expectUnusable(sync(), "damaged");
}

TEST_F(DeviceErrors, UnreadableRegistryIsNotEmpty) {
  publish("org.a");
  ASSERT_EQ(sync().status, 0);
  ASSERT_EQ(runTool({"backup", device(), path("backup")}).status, 0);
  {
    const auto database = device::Database::open(device() + "/device.db", device::Access::exclusive);
    ASSERT_TRUE(database.ok());
    device::Database::Session session(**database);
    ASSERT_TRUE(session.runScript("alter table bundles rename column version to lost").ok());
  }
  const std::string reason =
      device() + ": the device cannot be used (database: no such column: i.version); see to that and try again";
  expectUnusable(runTool({"apps", device()}), reason);
  expectUnusable(runTool({"apps", device(), "--json"}), reason);
  expectUnusable(runTool({"report", device()}), reason);
  expectUnusable(runTool({"report", device(), "--json"}), reason);
  expectUnusable(sync(), reason);
  expectUnusable(runTool({"backup", device(), path("another")}), reason);
  expectUnusable(runTool({"restore", device(), path("backup")}), reason);
}

TEST_F(DeviceErrors, InitRefusesExistingDevice) {
  expectUnusable(runTool({"init", device()}), device());
}

TEST_F(DeviceErrors, FailedSyncEndsItsTransfers) {
  const std::string folder = device() + "/root/var/mobile/Library/ApplicationSync";
  std::filesystem::remove_all(folder);
  write(folder, "in the way");
  publish("org.a");
  const Finished run = sync({"--log", path("log")});
  EXPECT_EQ(run.status, 3);
  EXPECT_THAT(run.err, HasSubstr("the device cannot be synced"));
  std::ifstream file(path("log"));
  const std::string log{std::istreambuf_iterator<char>(file), {}};
  const std::size_t transfers = log.find("|asset transfer ended withsuccess: n");
  ASSERT_NE(transfers, log.npos) << log;
  EXPECT_NE(log.find("|sync ended with success: n", transfers), log.npos) << log;
}

/// A small file system; needs the superuser to mount it.
class SmallDisk : public DeviceErrors {
 protected:
  void SetUp() override {
    std::filesystem::create_directory(disk());
    if (::geteuid() != 0 || ::mount("none", disk().c_str(), "tmpfs", 0, "size=3m") != 0) {
      GTEST_SKIP() << "no file system can be mounted here";
    }
    std::filesystem::create_directory(library());
    ASSERT_EQ(runTool({"init", disk() + "/device"}).status, 0);
  }
  void TearDown() override { ::umount2(disk().c_str(), MNT_DETACH); }
  [[nodiscard]] std::string disk() const { return path("disk"); }
};

TEST_F(SmallDisk, LargeAppFailsAndOthersAreInstalled) {
  // It is sent first, so that it does not take disk space from a concurrent install.
  publish("org.0.large", "1.0", {{"Notes.app/large", std::string(4'000'000, 'x')}});
  publish("org.a");
  publish("org.z");
  const Finished run = runTool({"sync", disk() + "/device", library(), "--json"});
  EXPECT_EQ(run.status, 1);
  EXPECT_THAT(run.out, HasSubstr("No space left on device"));
  EXPECT_THAT(endsIn(run.out),
              testing::UnorderedElementsAre("installed org.a", "failed org.0.large", "installed org.z"));
}

TEST_F(SmallDisk, ReadOnlyDeviceCanOnlyBeRead) {
  publish("org.a");
  ASSERT_EQ(::mount("none", disk().c_str(), nullptr, MS_REMOUNT | MS_RDONLY, nullptr), 0);
  EXPECT_EQ(runTool({"sync", disk() + "/device", library()}).status, 3);
  EXPECT_EQ(runTool({"apps", disk() + "/device"}).status, 0);
}

}  // namespace

}  // namespace appsync::test
