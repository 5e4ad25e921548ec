#include <cerrno>
#include <filesystem>
#include <map>
#include <string>

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include "device/Device.h"
#include "tests/device/InjectedFault.h"
#include "tests/support/TestDevice.h"

namespace appsync::test {

using device::Access;
using device::Device;
using device::DeviceFailure;

namespace {

namespace fs = std::filesystem;

/// Returns the error of an attempt to open a device, which must fail.
Error refusal(const Result<std::unique_ptr<Device>>& opened) {
  EXPECT_FALSE(opened.ok());
  return opened ? Error{} : opened.error();
}

Error failure(DeviceFailure code, const std::string& text) {
  return device::deviceError(code, text);
}

/// Returns every file and directory below with a hash of its content, except that of the database's shared memory,
/// which changes while the database is open.
std::map<std::string, std::size_t> contents(const std::string& folder) {
  std::map<std::string, std::size_t> all;
  for (const auto& entry : fs::recursive_directory_iterator(folder)) {
    const std::string path = entry.path().string();
    const bool counts = entry.is_regular_file() && !path.ends_with("-shm");
    all[path] = counts ? std::hash<std::string>()(readHostFile(path)) : 0;
  }
  return all;
}

void runSQL(const std::string& path, const char* sql) {
  auto database = device::Database::open(path, Access::exclusive);
  ASSERT_TRUE(database.ok());
  device::Database::Session session(**database);
  ASSERT_TRUE(session.runScript(sql).ok());
}

class DeviceAtPath : public testing::Test {
 protected:
  [[nodiscard]] std::string path() const { return folder_.path("device"); }
  Result<std::unique_ptr<Device>> open(Access access = Access::exclusive) { return Device::open(path(), access); }
  /// Creates a device without keeping it open.
  void make() { ASSERT_TRUE(Device::create(path()).ok()); }

  TemporaryFolder folder_;
};

}  // namespace

TEST_F(DeviceAtPath, CreatesMissingDirectory) {
  const auto device = Device::create(path());
  ASSERT_TRUE(device.ok()) << device.error().text;
  EXPECT_EQ((*device)->path(), path());
  EXPECT_TRUE((*device)->services().fileSystem().fileExists("/var/mobile/Media/PublicStaging"));
}

TEST_F(DeviceAtPath, AcceptsEmptyDirectory) {
  fs::create_directory(path());
  EXPECT_TRUE(Device::create(path()).ok());
}

TEST_F(DeviceAtPath, CreationLeavesNoIncompleteFiles) {
  make();
  for (const auto& [path, hash] : contents(path()))
    EXPECT_EQ(path.find("device.db.new"), path.npos) << path;
}

TEST_F(DeviceAtPath, RejectsExistingDevice) {
  make();
  EXPECT_EQ(refusal(Device::create(path())),
            failure(DeviceFailure::exists, path() + " is already a device; use it, or choose another folder"));
}

TEST_F(DeviceAtPath, RejectsDirectoryWithOtherFiles) {
  fs::create_directory(path());
  writeHostFile(path() + "/letter.txt", "Dear");
  EXPECT_EQ(
      refusal(Device::create(path())),
      failure(DeviceFailure::exists, path() + " is not empty; choose an empty folder, or one that does not exist yet"));
  EXPECT_EQ(contents(path()).size(), 1U);
}

TEST_F(DeviceAtPath, RejectsIncompleteDeviceWithoutLockFile) {
  fs::create_directories(path() + "/root/important");
  EXPECT_EQ(refusal(Device::create(path())).code, static_cast<long>(DeviceFailure::exists));
}

TEST_F(DeviceAtPath, RejectsMissingParent) {
  const auto device = Device::create(folder_.path("missing/device"));
  EXPECT_EQ(refusal(device),
            failure(DeviceFailure::missing, folder_.path("missing/device") +
                                                " cannot be created: its parent folder is missing; create that first"));
}

TEST_F(DeviceAtPath, RejectsFile) {
  writeHostFile(path(), "x");
  EXPECT_EQ(refusal(Device::create(path())).code, static_cast<long>(DeviceFailure::notADevice));
}

TEST_F(DeviceAtPath, CreationReportsFullDisk) {
  const auto device = withFaultHook([](const char*) { return ENOSPC; }, [this] { return Device::create(path()); });
  EXPECT_EQ(refusal(device), failure(DeviceFailure::noSpace, path() + ": the disk is full; make room and try again"));
}

TEST_F(DeviceAtPath, OpenReportsMissingDirectory) {
  EXPECT_EQ(refusal(open()),
            failure(DeviceFailure::missing, path() + ": there is no such folder; make a device with \"appsync init\""));
  EXPECT_EQ(refusal(open(Access::readOnly)).code, static_cast<long>(DeviceFailure::missing));
}

TEST_F(DeviceAtPath, OpenRejectsFile) {
  writeHostFile(path(), "x");
  EXPECT_EQ(refusal(open()),
            failure(DeviceFailure::notADevice,
                    path() + ": is no folder; name a device's folder, or make one with \"appsync init\""));
}

TEST_F(DeviceAtPath, OpenRejectsOtherDirectoryUnchanged) {
  fs::create_directory(path());
  EXPECT_EQ(
      refusal(open()),
      failure(
          DeviceFailure::notADevice,
          path() + " is not a device: it has no device.db; name a device's folder, or make one with \"appsync init\""));
  EXPECT_TRUE(fs::is_empty(path()));
}

TEST_F(DeviceAtPath, OpenRejectsDatabaseOfOtherProgram) {
  fs::create_directory(path());
  runSQL(path() + "/device.db", "create table recipes (name text)");
  EXPECT_EQ(refusal(open(Access::readOnly)),
            failure(DeviceFailure::notADevice,
                    path() + " is not a device: its device.db belongs to another program; name a device's folder"));
}

TEST_F(DeviceAtPath, OpenReportsInvalidDatabase) {
  make();
  writeHostFile(path() + "/device.db", std::string(8192, 'x'));
  const Error error = refusal(open());
  EXPECT_EQ(error.code, static_cast<long>(DeviceFailure::damaged));
  EXPECT_EQ(error.text, path() +
                            ": the device is damaged (database: file is not a database); put a copy of it in its "
                            "place, or make a new one with \"appsync init\"");
}

TEST_F(DeviceAtPath, OpenReportsCorruptDatabase) {
  make();
  const std::string database = path() + "/device.db";
  std::string bytes = readHostFile(database);
  ASSERT_GT(bytes.size(), 4096U * 3);
  std::fill(bytes.begin() + 4096, bytes.end() - 4096, '\x55');
  writeHostFile(database, bytes);
  for (const Access access : {Access::exclusive, Access::readOnly}) {
    EXPECT_EQ(refusal(open(access)).code, static_cast<long>(DeviceFailure::damaged));
  }
}

TEST_F(DeviceAtPath, OpenReportsNewerVersion) {
  make();
  runSQL(path() + "/device.db", "pragma user_version = 7");
  EXPECT_EQ(refusal(open()),
            failure(DeviceFailure::otherVersion,
                    path() + " was made by a newer version of appsync (layout 7, this one has 1); use that version"));
}

TEST_F(DeviceAtPath, OpenReportsOlderVersion) {
  make();
  runSQL(path() + "/device.db", "pragma user_version = 0");
  EXPECT_EQ(refusal(open()),
            failure(DeviceFailure::otherVersion,
                    path() + " was made by an older version of appsync (layout 0, this one has 1); use that version"));
}

TEST_F(DeviceAtPath, OneProcessHasExclusiveAccess) {
  const auto first = Device::create(path());
  ASSERT_TRUE(first.ok());
  EXPECT_EQ(refusal(open()),
            failure(DeviceFailure::held, path() + " is held by another process (pid " + std::to_string(getpid()) +
                                             "); wait until it has ended and try again"));
}

TEST_F(DeviceAtPath, LockEndsWithItsProcess) {
  make();
  EXPECT_TRUE(open().ok());
}

TEST_F(DeviceAtPath, ReadersOpenHeldDevice) {
  TestDevice holder;
  holder.install("com.a", "1.5");
  const auto reader = Device::open(holder.path(), Access::readOnly);
  ASSERT_TRUE(reader.ok()) << reader.error().text;
  auto& registry = (*reader)->services().defaultRegistry();
  EXPECT_EQ(registry.recordForIdentifier("com.a", platform::PlaceholderLookup::off)->bundleVersion(), "1.5");
  holder.install("com.b");
  EXPECT_TRUE(registry.applicationIsInstalled("com.b"));
}

TEST_F(DeviceAtPath, ReadOnlyDeviceDoesNotChange) {
  TestDevice device;
  device.install("com.a");
  device.placeholder("com.b");
  device.close();
  writeHostFile(device.path() + "/work/left", "x");
  const auto before = contents(device.path());
  {
    const auto reader = Device::open(device.path(), Access::readOnly);
    ASSERT_TRUE(reader.ok()) << reader.error().text;
    auto& services = (*reader)->services();
    EXPECT_EQ(services.fileSystem().writeFileAtomically("/tmp/x", {}).error(), Error::fromErrno(EROFS, "/tmp/x"));
    EXPECT_EQ(services.fileSystem().touch("/tmp").error(), Error::fromErrno(EROFS));
    EXPECT_FALSE(services.fileSystem().copyItem("/tmp", "/tmp2").ok());
    EXPECT_FALSE(services.defaultRegistry().uninstallApplication("com.a").ok());
    EXPECT_NE(services.uninstalledApps().clearUninstalled({"com.a"}), 0);
    EXPECT_TRUE(services.defaultRegistry().applicationIsInstalled("com.b"));
  }
  EXPECT_EQ(contents(device.path()), before);
}

TEST_F(DeviceAtPath, OpenRemovesIncompleteHostFiles) {
  make();
  const std::string left = path() + "/host-state.plist.draft-0123456789abcdef";
  writeHostFile(left, "half");
  ASSERT_TRUE(open(Access::readOnly).ok());
  EXPECT_TRUE(fs::exists(left));
  ASSERT_TRUE(open().ok());
  EXPECT_FALSE(fs::exists(left));
}

TEST_F(DeviceAtPath, ReadersSeeStoredProgress) {
  TestDevice device;
  device.placeholder("com.a");
  const auto progress = device.record("com.a")->installProgress();
  progress->setCompletedUnitCount(250);
  progress->setInstallState(platform::TSInstallState::Active);
  const auto reader = Device::open(device.path(), Access::readOnly);
  ASSERT_TRUE(reader.ok());
  const auto seen =
      (*reader)->services().defaultRegistry().recordForIdentifier("com.a", platform::PlaceholderLookup::on);
  ASSERT_NE(seen->installProgress(), nullptr);
  EXPECT_EQ(seen->installProgress()->completedUnitCount(), 250);
  EXPECT_EQ(seen->installProgress()->installState(), platform::TSInstallState::Active);
}

TEST_F(DeviceAtPath, MissingRootOrContainersAreNotRecreated) {
  TestDevice device;
  device.install("com.a", "1.5");
  device.close();
  for (const std::string folder : {"root", "root/var/mobile/Containers/Bundle"}) {
    const std::string away = device.path() + "/../away";
    fs::rename(device.path() + '/' + folder, away);
    for (const Access access : {Access::readOnly, Access::exclusive}) {
      EXPECT_EQ(
          refusal(Device::open(device.path(), access)),
          failure(DeviceFailure::damaged, device.path() + ": the device is damaged (it has no folder \"" + folder +
                                              "\"); mount what belongs there, or put a copy of the device in its "
                                              "place"));
    }
    fs::rename(away, device.path() + '/' + folder);
    device.reopen();
    EXPECT_EQ(device.record("com.a")->bundleVersion(), "1.5");
    EXPECT_EQ(device.containers(), 1);
    device.close();
  }
}

TEST_F(DeviceAtPath, MissingAppTablesAreNotRecreated) {
  TestDevice device;
  device.install("com.a", "1.5");
  device.close();
  for (const std::string table : {"apps", "bundles"}) {
    runSQL(device.path() + "/device.db", ("alter table " + table + " rename to lost").c_str());
    for (const Access access : {Access::readOnly, Access::exclusive}) {
      EXPECT_EQ(refusal(Device::open(device.path(), access)).text,
                device.path() + ": the device cannot be used (database: no such table: " + table +
                    "); see to that and try again");
    }
    runSQL(device.path() + "/device.db", ("alter table lost rename to " + table).c_str());
    device.reopen();
    EXPECT_EQ(device.record("com.a")->bundleVersion(), "1.5");
    EXPECT_EQ(device.containers(), 1);
    device.close();
  }
}

TEST_F(DeviceAtPath, OpenRecreatesOptionalDirectories) {
  make();
  fs::remove(path() + "/work");
  fs::remove_all(path() + "/root/tmp");
  fs::remove_all(path() + "/root/var/mobile/Media");
  const auto holder = open();
  ASSERT_TRUE(holder.ok()) << holder.error().text;
  EXPECT_TRUE((*holder)->services().fileSystem().fileExists("/tmp"));
  EXPECT_TRUE((*holder)->services().fileSystem().fileExists("/var/mobile/Media/PublicStaging"));
}

TEST_F(DeviceAtPath, OpenReportsMissingWritePermission) {
  if (geteuid() == 0) GTEST_SKIP() << "nothing is forbidden to this user";
  make();
  fs::permissions(path(), fs::perms::owner_read | fs::perms::owner_exec);
  fs::remove(path() + "/lock");
  EXPECT_EQ(refusal(open()).code, static_cast<long>(DeviceFailure::readOnly));
  fs::permissions(path(), fs::perms::owner_all);
}

TEST(DeviceErrors, ReadOnlyIsReportedForExclusiveAccessOnly) {
  const std::string path = "/d";
  EXPECT_EQ(device::deviceError(path, Access::exclusive, Error::fromErrno(EROFS)),
            failure(DeviceFailure::readOnly, "/d: may not be written; change its permissions, or use a copy"));
  EXPECT_EQ(
      device::deviceError(path, Access::readOnly, Error::fromErrno(EACCES, "/d")),
      failure(DeviceFailure::notAccessible, "/d: the device cannot be used (" + Error::fromErrno(EACCES, "/d").text +
                                                "); see to that and try again"));
  EXPECT_EQ(
      device::deviceError(path, Access::exclusive, Error{std::string(device::kSQLiteDomain), 13, "full", nullptr}).code,
      static_cast<long>(DeviceFailure::noSpace));
  EXPECT_EQ(
      device::deviceError(path, Access::exclusive, Error{std::string(device::kSQLiteDomain), 11, "bad", nullptr}).code,
      static_cast<long>(DeviceFailure::damaged));
}

}  // namespace appsync::test
