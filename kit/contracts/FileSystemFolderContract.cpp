// FileSystemContract: directories; copying, moving and removing.
#include <atomic>
#include <cerrno>

#include "kit/contracts/Errors.h"
#include "kit/contracts/FileSystemContract.h"
#include "kit/fakes/Threads.h"

namespace appsync::test {

using platform::IntermediateDirectories;
using platform::OwnerAttributes;

TEST_P(FileSystemContract, CreatesADirectory) {
  EXPECT_TRUE(files().createDirectory(at("folder"), IntermediateDirectories::require, {}).ok());
  EXPECT_TRUE(files().attributesOfItem(at("folder"))->isDirectory);
}

TEST_P(FileSystemContract, RequireFailsIfTheDirectoryExists) {
  makeFolder("folder");
  write("folder/file", "kept");
  EXPECT_TRUE(failsWith(EEXIST, errorOf(files().createDirectory(at("folder"), IntermediateDirectories::require, {}))));
  EXPECT_EQ(read("folder/file"), "kept");
}

TEST_P(FileSystemContract, RequireFailsIfTheParentIsMissing) {
  EXPECT_TRUE(failsWith(ENOENT, errorOf(files().createDirectory(at("a/b"), IntermediateDirectories::require, {}))));
  EXPECT_FALSE(exists("a"));
}

TEST_P(FileSystemContract, CreatesMissingParents) {
  EXPECT_TRUE(files().createDirectory(at("a/b/c"), IntermediateDirectories::create, {}).ok());
  EXPECT_TRUE(files().attributesOfItem(at("a/b/c"))->isDirectory);
}

TEST_P(FileSystemContract, CreateLeavesAnExistingDirectory) {
  makeFolder("folder");
  write("folder/file", "kept");
  EXPECT_TRUE(files().createDirectory(at("folder"), IntermediateDirectories::create, {}).ok());
  EXPECT_EQ(read("folder/file"), "kept");
}

TEST_P(FileSystemContract, ExistingDirectoryKeepsItsOwners) {
  const OwnerAttributes owners{"mobile", "mobile"};
  ASSERT_TRUE(files().createDirectory(at("folder"), IntermediateDirectories::create, owners).ok());
  ASSERT_TRUE(files().createDirectory(at("folder"), IntermediateDirectories::create, {"root", "wheel"}).ok());
  const std::optional<OwnerAttributes> kept = subject().ownersOf(at("folder"));
  if (!kept) GTEST_SKIP() << "the subject cannot read owners";
  EXPECT_EQ(*kept, owners);
}

TEST_P(FileSystemContract, CreatedParentsHaveTheGivenOwners) {
  const OwnerAttributes owners{"mobile", "mobile"};
  makeFolder("above");
  ASSERT_TRUE(files().createDirectory(at("above/parent/folder"), IntermediateDirectories::create, owners).ok());
  const std::optional<OwnerAttributes> given = subject().ownersOf(at("above/parent/folder"));
  if (!given) GTEST_SKIP() << "the subject cannot read owners";
  EXPECT_EQ(*given, owners);
  EXPECT_EQ(subject().ownersOf(at("above/parent")), owners);
  EXPECT_NE(subject().ownersOf(at("above")), owners);
}

TEST_P(FileSystemContract, CreateDoesNotReplaceAFile) {
  write("file", "kept");
  EXPECT_FALSE(files().createDirectory(at("file"), IntermediateDirectories::create, {}).ok());
  EXPECT_FALSE(files().createDirectory(at("file"), IntermediateDirectories::require, {}).ok());
  EXPECT_FALSE(files().createDirectory(at("file/below"), IntermediateDirectories::create, {}).ok());
  EXPECT_EQ(read("file"), "kept");
}

TEST_P(FileSystemContract, CreatedParentsRemainAfterAFailure) {
  const std::string impossible(300, 'x');
  EXPECT_TRUE(failsWith(
      ENAMETOOLONG, errorOf(files().createDirectory(at("a/b/" + impossible), IntermediateDirectories::create, {}))));
  EXPECT_TRUE(exists("a/b"));
}

TEST_P(FileSystemContract, CreatesOneDirectoryConcurrently) {
  runOnThreads(8, [&](std::size_t) {
    EXPECT_TRUE(files().createDirectory(at("a/b/c"), IntermediateDirectories::create, {}).ok());
  });
}

// Copying.

TEST_P(FileSystemContract, CopyIsIndependent) {
  write("file", "first");
  EXPECT_TRUE(files().copyItem(at("file"), at("copy")).ok());
  write("file", "second");
  EXPECT_EQ(read("copy"), "first");
}

TEST_P(FileSystemContract, CopiesADirectoryWithItsContents) {
  makeFolder("from/deep/empty");
  write("from/a", "a");
  write("from/deep/b", "b");
  EXPECT_TRUE(files().copyItem(at("from"), at("to")).ok());
  EXPECT_EQ(read("to/a"), "a");
  EXPECT_EQ(read("to/deep/b"), "b");
  EXPECT_TRUE(exists("to/deep/empty"));
  EXPECT_EQ(read("from/deep/b"), "b");
}

TEST_P(FileSystemContract, CopyReplacesNothing) {
  write("from", "from");
  write("to", "to");
  makeFolder("folder");
  EXPECT_TRUE(failsWith(EEXIST, errorOf(files().copyItem(at("from"), at("to")))));
  EXPECT_TRUE(failsWith(EEXIST, errorOf(files().copyItem(at("from"), at("folder")))));
  EXPECT_EQ(read("to"), "to");
  EXPECT_FALSE(exists("folder/from"));
}

TEST_P(FileSystemContract, CopyingAMissingItemFails) {
  EXPECT_TRUE(failsWith(ENOENT, errorOf(files().copyItem(at("missing"), at("to")))));
  EXPECT_FALSE(exists("to"));
}

TEST_P(FileSystemContract, CopyingIntoAMissingDirectoryFails) {
  write("from", "kept");
  EXPECT_TRUE(failsWith(ENOENT, errorOf(files().copyItem(at("from"), at("missing/to")))));
  EXPECT_EQ(read("from"), "kept");
}

// Moving.

TEST_P(FileSystemContract, MovesAFile) {
  write("from", "text");
  EXPECT_TRUE(files().moveItem(at("from"), at("to")).ok());
  EXPECT_EQ(read("to"), "text");
  EXPECT_FALSE(exists("from"));
}

TEST_P(FileSystemContract, MovesADirectoryWithItsContents) {
  makeFolder("from/deep");
  write("from/deep/file", "text");
  makeFolder("other");
  EXPECT_TRUE(files().moveItem(at("from"), at("other/to")).ok());
  EXPECT_EQ(read("other/to/deep/file"), "text");
  EXPECT_FALSE(exists("from"));
}

TEST_P(FileSystemContract, MoveReplacesNothing) {
  write("from", "from");
  write("to", "to");
  makeFolder("folder");
  makeFolder("emptyFolder");
  EXPECT_TRUE(failsWith(EEXIST, errorOf(files().moveItem(at("from"), at("to")))));
  EXPECT_TRUE(failsWith(EEXIST, errorOf(files().moveItem(at("folder"), at("emptyFolder")))));
  EXPECT_EQ(read("from"), "from");
  EXPECT_EQ(read("to"), "to");
  EXPECT_TRUE(exists("folder"));
}

TEST_P(FileSystemContract, MovingOntoItselfFails) {
  write("file", "kept");
  EXPECT_TRUE(failsWith(EEXIST, errorOf(files().moveItem(at("file"), at("file")))));
  EXPECT_EQ(read("file"), "kept");
}

TEST_P(FileSystemContract, MovingAMissingItemFails) {
  EXPECT_TRUE(failsWith(ENOENT, errorOf(files().moveItem(at("missing"), at("to")))));
  EXPECT_FALSE(exists("to"));
}

TEST_P(FileSystemContract, MovingIntoAMissingDirectoryLeavesTheItem) {
  write("from", "kept");
  EXPECT_TRUE(failsWith(ENOENT, errorOf(files().moveItem(at("from"), at("missing/to")))));
  EXPECT_EQ(read("from"), "kept");
}

TEST_P(FileSystemContract, MovingADirectoryIntoItselfFails) {
  makeFolder("folder");
  write("folder/file", "kept");
  EXPECT_TRUE(failsWith(EINVAL, errorOf(files().moveItem(at("folder"), at("folder/inside")))));
  EXPECT_EQ(read("folder/file"), "kept");
}

TEST_P(FileSystemContract, OneOfManyThreadsMovesAnItem) {
  write("from", "text");
  std::atomic<int> moved = 0;
  runOnThreads(8, [&](std::size_t index) {
    if (files().moveItem(at("from"), at("to" + std::to_string(index))).ok()) ++moved;
  });
  EXPECT_EQ(moved, 1);
}

// Removing.

TEST_P(FileSystemContract, RemovesAFile) {
  write("file", "x");
  EXPECT_TRUE(files().removeItem(at("file")).ok());
  EXPECT_FALSE(exists("file"));
}

TEST_P(FileSystemContract, RemovesADirectoryWithItsContents) {
  makeFolder("folder/deep/deeper");
  write("folder/deep/file", "x");
  EXPECT_TRUE(files().removeItem(at("folder")).ok());
  EXPECT_FALSE(exists("folder"));
}

TEST_P(FileSystemContract, RemovingAMissingItemFails) {
  EXPECT_TRUE(failsWith(ENOENT, errorOf(files().removeItem(at("missing")))));
}

TEST_P(FileSystemContract, RemovingALinkLeavesItsTarget) {
  makeFolder("folder");
  write("folder/file", "kept");
  if (!subject().makeLink(at("link"), "folder")) GTEST_SKIP() << "the subject has no symbolic links";
  EXPECT_TRUE(files().removeItem(at("link")).ok());
  EXPECT_FALSE(exists("link"));
  EXPECT_EQ(read("folder/file"), "kept");
}

TEST_P(FileSystemContract, RemovesADanglingLink) {
  if (!subject().makeLink(at("link"), "missing")) GTEST_SKIP() << "the subject has no symbolic links";
  EXPECT_TRUE(files().removeItem(at("link")).ok());
  EXPECT_TRUE(failsWith(ENOENT, errorOf(files().removeItem(at("link")))));
}

TEST_P(FileSystemContract, RemovingADirectoryLeavesTargetsOfItsLinks) {
  makeFolder("outside");
  write("outside/file", "kept");
  makeFolder("folder");
  if (!subject().makeLink(at("folder/link"), "../outside")) GTEST_SKIP() << "the subject has no symbolic links";
  EXPECT_TRUE(files().removeItem(at("folder")).ok());
  EXPECT_EQ(read("outside/file"), "kept");
}

}  // namespace appsync::test
