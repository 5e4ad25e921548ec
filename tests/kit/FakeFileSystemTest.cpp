#include <cerrno>

#include <gtest/gtest-spi.h>
#include <gtest/gtest.h>

#include "kit/fakes/FakeFileSystem.h"

namespace appsync::test {
namespace {

using Lines = std::vector<std::string>;
using platform::IntermediateDirectories;
using platform::OwnerAttributes;

const Error kFailure{"POSIX", EIO, "injected", nullptr};

class FakeFileSystemTest : public testing::Test {
 protected:
  CallJournal journal;
  FakeFileSystem files{journal};
};

TEST_F(FakeFileSystemTest, DoesNotJournalPreparations) {
  files.put("/a/b", "text");
  files.putFolder("/c");
  files.putLink("/link", "a/b");
  EXPECT_EQ(files.text("/link"), "text");
  EXPECT_TRUE(files.hasFolder("/c"));
  files.erase("/link");
  EXPECT_FALSE(files.has("/link"));
  EXPECT_EQ(journal.lines(), Lines());
}

TEST_F(FakeFileSystemTest, JournalsCallsWithTheirPaths) {
  static_cast<void>(files.readFile("/a"));
  static_cast<void>(files.moveItem("/a", "/b"));
  static_cast<void>(files.createDirectory("/c", IntermediateDirectories::create, {}));
  EXPECT_EQ(journal.lines(),
            (Lines{"fileSystem.readFile /a", "fileSystem.moveItem /a /b", "fileSystem.createDirectory /c"}));
}

TEST_F(FakeFileSystemTest, ListsPathsInOrder) {
  files.put("/a/z", "1");
  files.put("/a/folder/y", "2");
  EXPECT_EQ(files.paths("/a"), (Lines{"/a/folder/", "/a/folder/y", "/a/z"}));
  EXPECT_EQ(files.paths(), (Lines{"/a/", "/a/folder/", "/a/folder/y", "/a/z", "/tmp/"}));
  EXPECT_EQ(files.paths("/missing"), Lines());
}

TEST_F(FakeFileSystemTest, InjectedFailureChangesNothing) {
  files.put("/a", "old");
  files.failures.failNext(FileOperation::writeFileAtomically, "/a", kFailure);
  EXPECT_EQ(files.writeFileAtomically("/a", bytesOf("new")).failure(), kFailure);
  EXPECT_EQ(files.text("/a"), "old");
  EXPECT_EQ(files.writes("/a"), 0U);
  EXPECT_TRUE(files.writeFileAtomically("/a", bytesOf("new")).ok());
  EXPECT_EQ(files.text("/a"), "new");
  EXPECT_EQ(files.writes("/a"), 1U);
}

TEST_F(FakeFileSystemTest, MoveFailsByEitherPath) {
  files.put("/from", "text");
  files.failures.failNext(FileOperation::moveItem, "/from", kFailure);
  EXPECT_FALSE(files.moveItem("/from", "/to").ok());
  files.failures.failNext(FileOperation::moveItem, "/to", kFailure);
  EXPECT_FALSE(files.moveItem("/from", "/to").ok());
  EXPECT_EQ(files.text("/from"), "text");
  EXPECT_TRUE(files.moveItem("/from", "/to").ok());
}

TEST_F(FakeFileSystemTest, JournalHookFailsEveryOperation) {
  files.put("/a", "text");
  journal.setHook([](std::string_view, std::string_view) -> std::optional<Error> { return kFailure; });
  EXPECT_FALSE(files.fileExists("/a"));
  EXPECT_FALSE(files.attributesOfItem("/a").ok());
  EXPECT_FALSE(files.readFile("/a").ok());
  EXPECT_FALSE(files.writeFileAtomically("/a", bytesOf("x")).ok());
  EXPECT_FALSE(files.createFile("/b", bytesOf("x"), {}).ok());
  EXPECT_FALSE(files.createDirectory("/c", IntermediateDirectories::create, {}).ok());
  EXPECT_FALSE(files.copyItem("/a", "/d").ok());
  EXPECT_FALSE(files.moveItem("/a", "/d").ok());
  EXPECT_FALSE(files.removeItem("/a").ok());
  EXPECT_FALSE(files.touch("/a").ok());
  EXPECT_EQ(files.paths(), (Lines{"/a", "/tmp/"}));
  EXPECT_EQ(files.text("/a"), "text");
}

TEST_F(FakeFileSystemTest, ReturnsOwnersGivenAtCreation) {
  const OwnerAttributes owners{"mobile", "mobile"};
  EXPECT_TRUE(files.createDirectory("/a/b", IntermediateDirectories::create, owners).ok());
  EXPECT_EQ(files.owners("/a/b"), owners);
  files.put("/c", "x");
  EXPECT_EQ(files.owners("/c"), OwnerAttributes());
  EXPECT_EQ(files.owners("/missing"), std::nullopt);
}

TEST_F(FakeFileSystemTest, CountsTouches) {
  files.put("/a", "x");
  EXPECT_TRUE(files.touch("/a").ok());
  EXPECT_TRUE(files.touch("/a").ok());
  EXPECT_EQ(files.touches("/a"), 2U);
  EXPECT_EQ(files.touches("/missing"), 0U);
}

TEST_F(FakeFileSystemTest, ImpossiblePreparationFailsTheTest) {
  files.put("/a", "x");
  EXPECT_NONFATAL_FAILURE(files.putFolder("/a/b"), "no folder can be put at /a/b");
  EXPECT_NONFATAL_FAILURE(files.put("/tmp", "x"), "no file can be put at /tmp");
}

}  // namespace
}  // namespace appsync::test
