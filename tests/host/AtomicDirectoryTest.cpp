// Folders that are whole or not there.
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
using host::FolderDraft;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::UnorderedElementsAre;

class FolderDraftTest : public testing::Test {
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
  static void fill(const FolderDraft& draft) { ASSERT_EQ(device::tree::create(draft.folder(), "file", {}), 0); }

  TemporaryFolder folder_;
};

TEST_F(FolderDraftTest, ThatIsPublishedIsAllThatThereIs) {
  {
    Result<FolderDraft> draft = FolderDraft::make(path());
    ASSERT_TRUE(draft.ok());
    fill(*draft);
    EXPECT_FALSE(fs::exists(path()));
    ASSERT_TRUE(draft->publish().ok());
  }
  EXPECT_THAT(in(path("")), ElementsAre("backup"));
  EXPECT_THAT(in(path()), ElementsAre("file"));
}

TEST_F(FolderDraftTest, ThatIsNotPublishedLeavesNothing) {
  {
    const Result<FolderDraft> draft = FolderDraft::make(path());
    ASSERT_TRUE(draft.ok());
    fill(*draft);
  }
  EXPECT_THAT(in(path("")), IsEmpty());
}

TEST_F(FolderDraftTest, TakesOverWhatAKillHasLeft) {
  for (const std::string left : {"", "content/deep/file", "half-removed/file"}) {
    fs::create_directory(path(".backup.partial"));
    if (!left.empty()) {
      write(".backup.partial/.appsync-draft");
      write(".backup.partial/" + left);
    }
    {
      Result<FolderDraft> draft = FolderDraft::make(path());
      ASSERT_TRUE(draft.ok()) << draft.error().text;
      fill(*draft);
      ASSERT_TRUE(draft->publish().ok());
    }
    EXPECT_THAT(in(path("")), ElementsAre("backup"));
    EXPECT_THAT(in(path()), ElementsAre("file"));
    fs::remove_all(path());
  }
}

TEST_F(FolderDraftTest, LeavesAFolderOfItsUserAlone) {
  write(".backup.partial/letter");
  const Result<FolderDraft> draft = FolderDraft::make(path());
  ASSERT_FALSE(draft.ok());
  EXPECT_EQ(draft.error(),
            (Error{std::string(domains::kPOSIX), EEXIST,
                   path(".backup.partial") + " is in the way and holds no unfinished backup; move it away, "
                                             "or choose another name",
                   nullptr}));
  EXPECT_THAT(in(path(".backup.partial")), ElementsAre("letter"));
}

TEST_F(FolderDraftTest, BelongsToOneProcessAtATime) {
  const Result<FolderDraft> first = FolderDraft::make(path());
  ASSERT_TRUE(first.ok());
  fill(*first);
  const Result<FolderDraft> second = FolderDraft::make(path());
  ASSERT_FALSE(second.ok());
  EXPECT_EQ(second.error().text, path() + " is just being made by another process; wait until that has ended");
  struct stat status {};
  EXPECT_EQ(fstatat(first->folder(), "file", &status, 0), 0);
}

TEST_F(FolderDraftTest, WhoeverWaitsForItsLockDoesNotGetWhatIsPublished) {
  device::FileDescriptor waiting;
  {
    Result<FolderDraft> draft = FolderDraft::make(path());
    ASSERT_TRUE(draft.ok());
    waiting = device::FileDescriptor(open(path(".backup.partial").c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    ASSERT_TRUE(waiting.valid());
    EXPECT_NE(flock(waiting.get(), LOCK_EX | LOCK_NB), 0);
    fill(*draft);
    ASSERT_TRUE(draft->publish().ok());
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
