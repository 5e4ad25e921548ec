// Behaviour of the device that the file-system contract leaves open.
#include <cerrno>
#include <filesystem>
#include <optional>
#include <string>

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include "device/storage/DeviceFileSystem.h"
#include "tests/device/InjectedFault.h"
#include "tests/support/TestDevice.h"

namespace appsync::test {

using platform::IntermediateDirectories;
using platform::OwnerAttributes;

namespace {

namespace fs = std::filesystem;

class DeviceFileSystemTest : public testing::Test {
 protected:
  [[nodiscard]] device::DeviceFileSystem& files() { return device_.files(); }
  void write(const std::string& path, std::string_view content) {
    ASSERT_TRUE(files().writeFileAtomically(path, bytesOf(content)).ok());
  }

  TestDevice device_;
};

}  // namespace

TEST_F(DeviceFileSystemTest, MapsDevicePathsToRoot) {
  write("/var/mobile/file", "x");
  EXPECT_EQ(readHostFile(device_.path() + "/root/var/mobile/file"), "x");
  EXPECT_TRUE(files().fileExists("/"));
}

TEST_F(DeviceFileSystemTest, StoresOwners) {
  const OwnerAttributes owners{"mobile", "staff"};
  ASSERT_TRUE(files().createDirectory("/var/a/b", IntermediateDirectories::create, owners).ok());
  ASSERT_TRUE(files().createFile("/var/a/b/c", {}, {"mobile", std::nullopt}).ok());
  if (files().ownersOfItem("/var/a/b")->ownerAccountName == std::nullopt) GTEST_SKIP() << "no extended attributes here";
  EXPECT_EQ(*files().ownersOfItem("/var/a/b"), owners);
  EXPECT_EQ(*files().ownersOfItem("/var/a"), owners);
  EXPECT_EQ(*files().ownersOfItem("/var/a/b/c"), (OwnerAttributes{"mobile", std::nullopt}));
  EXPECT_EQ(*files().ownersOfItem("/var"), OwnerAttributes());
}

TEST_F(DeviceFileSystemTest, LeavesNoIncompleteFiles) {
  ASSERT_TRUE(files().createDirectory("/var/folder/deep/deeper", IntermediateDirectories::create, {}).ok());
  write("/var/folder/deep/file", "x");
  EXPECT_FALSE(files().writeFileAtomically("/var/folder", bytesOf("x")).ok());
  EXPECT_FALSE(files().copyItem("/var/folder", "/var/mobile").ok());
  EXPECT_TRUE(files().removeItem("/var/folder").ok());
  EXPECT_TRUE(device_.isTidy());
}

TEST_F(DeviceFileSystemTest, CopiesLinksAsLinks) {
  ASSERT_TRUE(files().createDirectory("/var/from", IntermediateDirectories::require, {}).ok());
  fs::create_symlink("../secret", device_.host("/var/from/link"));
  ASSERT_TRUE(files().copyItem("/var/from", "/var/to").ok());
  EXPECT_EQ(fs::read_symlink(device_.host("/var/to/link")), "../secret");
}

TEST_F(DeviceFileSystemTest, RejectsPipes) {
  ASSERT_EQ(mkfifo(device_.host("/var/pipe").c_str(), 0644), 0);
  EXPECT_EQ(files().copyItem("/var/pipe", "/var/copy").error().code, EINVAL);
  EXPECT_EQ(files().readFile("/var/pipe").error().code, EINVAL);
  EXPECT_FALSE(files().fileExists("/var/copy"));
}

TEST_F(DeviceFileSystemTest, ReplacesLinkItself) {
  write("/var/target", "kept");
  fs::create_symlink("target", device_.host("/var/link"));
  write("/var/link", "new");
  EXPECT_EQ(readHostFile(device_.host("/var/target")), "kept");
  EXPECT_FALSE(fs::is_symlink(device_.host("/var/link")));
}

TEST_F(DeviceFileSystemTest, RemovesDeepTrees) {
  // Deeper than the limit of open files.
  fs::path deep = device_.host("/var/deep");
  fs::create_directory(deep);
  const fs::path before = fs::current_path();
  fs::current_path(deep);
  for (int level = 0; level < 1500; ++level) {
    ASSERT_EQ(mkdir("d", 0755), 0);
    ASSERT_EQ(chdir("d"), 0);
  }
  fs::current_path(before);
  EXPECT_TRUE(files().removeItem("/var/deep").ok());
  EXPECT_TRUE(device_.isTidy());
}

TEST_F(DeviceFileSystemTest, FailedOperationsChangeNothing) {
  ASSERT_TRUE(files().createDirectory("/var/from/deep", IntermediateDirectories::create, {}).ok());
  write("/var/from/deep/file", std::string(100'000, 'x'));
  for (long faultPoint = 1;; ++faultPoint) {
    write("/var/file", "old");
    std::optional<InjectedFault> fault(faultPoint);
    const Status written = files().writeFileAtomically("/var/file", bytesOf("new"));
    const Status copied = files().copyItem("/var/from", "/var/to");
    const Status moved = files().moveItem("/var/to", "/var/moved");
    fault.reset();
    EXPECT_EQ(readHostFile(device_.host("/var/file")), written ? "new" : "old");
    EXPECT_EQ(files().fileExists("/var/moved/deep/file"), copied.ok() && moved.ok()) << faultPoint;
    EXPECT_EQ(files().fileExists("/var/to"), copied.ok() && !moved.ok()) << faultPoint;
    static_cast<void>(files().removeItem("/var/to"));
    static_cast<void>(files().removeItem("/var/moved"));
    EXPECT_TRUE(device_.isTidy()) << faultPoint;
    if (written && copied && moved) break;
  }
}

}  // namespace appsync::test
