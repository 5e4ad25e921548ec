#include <cerrno>
#include <filesystem>
#include <fstream>
#include <string>
#include <vector>

#include <fcntl.h>
#include <gmock/gmock.h>
#include <sys/file.h>
#include <sys/stat.h>

#include "device/storage/FileTree.h"
#include "host/AtomicDirectory.h"
#include "kit/fakes/TemporaryFolder.h"

namespace appsync::test {
namespace {

namespace fs = std::filesystem;
using host::AtomicDirectory;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::UnorderedElementsAre;

class AtomicDirectoryTest : public testing::Test {
 protected:
  [[nodiscard]] std::string path(const std::string& name = "backup") const { return folder_.path(name); }
  [[nodiscard]] static std::vector<std::string> in(const std::string& folder) {
    std::vector<std::string> names;
    for (const auto& entry : fs::directory_iterator(folder))
      names.push_back(entry.path().filename());
    return names;
  }
  void write(const std::string& name) const {
    fs::create_directories(fs::path(path(name)).parent_path());
    std::ofstream(path(name)) << "mine";
  }
  static void fill(const AtomicDirectory& directory) {
    ASSERT_EQ(device::tree::create(directory.folder(), "file", {}), 0);
  }

  TemporaryFolder folder_;
};

TEST_F(AtomicDirectoryTest, PublishLeavesOnlyTheDirectory) {
  {
    Result<AtomicDirectory> directory = AtomicDirectory::make(path());
    ASSERT_TRUE(directory.ok());
    fill(*directory);
    EXPECT_FALSE(fs::exists(path()));
    ASSERT_TRUE(directory->publish().ok());
  }
  EXPECT_THAT(in(path("")), ElementsAre("backup"));
  EXPECT_THAT(in(path()), ElementsAre("file"));
}

TEST_F(AtomicDirectoryTest, UnpublishedLeavesNothing) {
  {
    const Result<AtomicDirectory> directory = AtomicDirectory::make(path());
    ASSERT_TRUE(directory.ok());
    fill(*directory);
  }
  EXPECT_THAT(in(path("")), IsEmpty());
}

TEST_F(AtomicDirectoryTest, ReplacesLeftoversOfACrash) {
  for (const std::string left : {"", "content/deep/file", "half-removed/file"}) {
    fs::create_directory(path(".backup.partial"));
    if (!left.empty()) {
      write(".backup.partial/.appsync-draft");
      write(".backup.partial/" + left);
    }
    {
      Result<AtomicDirectory> directory = AtomicDirectory::make(path());
      ASSERT_TRUE(directory.ok()) << directory.error().text;
      fill(*directory);
      ASSERT_TRUE(directory->publish().ok());
    }
    EXPECT_THAT(in(path("")), ElementsAre("backup"));
    EXPECT_THAT(in(path()), ElementsAre("file"));
    fs::remove_all(path());
  }
}

TEST_F(AtomicDirectoryTest, KeepsForeignDirectory) {
  write(".backup.partial/letter");
  const Result<AtomicDirectory> directory = AtomicDirectory::make(path());
  ASSERT_FALSE(directory.ok());
  EXPECT_EQ(directory.error(),
            (Error{std::string(domains::kPOSIX), EEXIST,
                   path(".backup.partial") + " already exists and is not an unfinished backup; move it away, "
                                             "or choose another name",
                   nullptr}));
  EXPECT_THAT(in(path(".backup.partial")), ElementsAre("letter"));
}

TEST_F(AtomicDirectoryTest, IsLockedByOneProcess) {
  const Result<AtomicDirectory> first = AtomicDirectory::make(path());
  ASSERT_TRUE(first.ok());
  fill(*first);
  const Result<AtomicDirectory> second = AtomicDirectory::make(path());
  ASSERT_FALSE(second.ok());
  EXPECT_EQ(second.error().text, path() + " is being created by another process; wait until that process has ended");
  struct stat status {};
  EXPECT_EQ(fstatat(first->folder(), "file", &status, 0), 0);
}

TEST_F(AtomicDirectoryTest, WaitingForLockDoesNotYieldPublished) {
  device::FileDescriptor waiting;
  {
    Result<AtomicDirectory> directory = AtomicDirectory::make(path());
    ASSERT_TRUE(directory.ok());
    waiting = device::FileDescriptor(open(path(".backup.partial").c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    ASSERT_TRUE(waiting.valid());
    EXPECT_NE(flock(waiting.get(), LOCK_EX | LOCK_NB), 0);
    fill(*directory);
    ASSERT_TRUE(directory->publish().ok());
  }
  ASSERT_EQ(flock(waiting.get(), LOCK_EX | LOCK_NB), 0);
  struct stat locked {};
  struct stat published {};
  ASSERT_EQ(fstat(waiting.get(), &locked), 0);
  ASSERT_EQ(stat(path().c_str(), &published), 0);
  EXPECT_NE(locked.st_ino, published.st_ino);
  EXPECT_EQ(locked.st_nlink, 0U);
}

}  // namespace
}  // namespace appsync::test
