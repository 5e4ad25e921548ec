#include "kit/contracts/FileSystemContract.h"

#include <atomic>
#include <cerrno>
#include <cstddef>

#include "kit/contracts/Errors.h"
#include "kit/fakes/Threads.h"

namespace appsync::test {

using platform::FileAttributes;
using platform::IntermediateDirectories;
using platform::OwnerAttributes;

GTEST_ALLOW_UNINSTANTIATED_PARAMETERIZED_TEST(FileSystemContract);

void FileSystemContract::write(std::string_view name, std::string_view text) {
  ASSERT_TRUE(files().writeFileAtomically(at(name), bytesOf(text)).ok());
}

void FileSystemContract::makeFolder(std::string_view name) {
  ASSERT_TRUE(files().createDirectory(at(name), IntermediateDirectories::create, {}).ok());
}

std::string FileSystemContract::read(std::string_view name) {
  const Result<Bytes> bytes = files().readFile(at(name));
  return bytes ? std::string(textOf(*bytes)) : "(none)";
}

namespace {

std::string patternOf(char letter) {
  return std::string(200'000, letter);
}

bool isOnePattern(const std::string& text) {
  return text.size() == patternOf('a').size() && text.find_first_not_of(text.front()) == std::string::npos;
}

}  // namespace

// Looking.

TEST_P(FileSystemContract, AFileReadsBackAsItWasWritten) {
  const std::string text("a\0b\xff\n", 5);
  write("file", text);
  EXPECT_EQ(read("file"), text);
}

TEST_P(FileSystemContract, AnEmptyFileIsThere) {
  write("file", "");
  EXPECT_TRUE(exists("file"));
  EXPECT_EQ(read("file"), "");
}

TEST_P(FileSystemContract, ALargeFileIsReadInOneGo) {
  const std::string text(3'000'001, 'x');
  write("file", text);
  EXPECT_EQ(read("file"), text);
}

TEST_P(FileSystemContract, FilesAndFoldersExistAndNothingElse) {
  write("file", "x");
  makeFolder("folder");
  EXPECT_TRUE(exists("file"));
  EXPECT_TRUE(exists("folder"));
  EXPECT_FALSE(exists("other"));
  EXPECT_FALSE(exists("file/below"));
}

TEST_P(FileSystemContract, ALinkExistsWhenItLeadsToSomething) {
  write("file", "x");
  if (!subject().makeLink(at("link"), "file")) GTEST_SKIP() << "no links";
  ASSERT_TRUE(subject().makeLink(at("dangling"), "missing"));
  EXPECT_TRUE(exists("link"));
  EXPECT_FALSE(exists("dangling"));
}

TEST_P(FileSystemContract, AttributesTellSizeAndKind) {
  write("file", "12345");
  makeFolder("folder");
  const Result<FileAttributes> file = files().attributesOfItem(at("file"));
  ASSERT_TRUE(file.ok());
  EXPECT_EQ(file->size, 5U);
  EXPECT_FALSE(file->isDirectory);
  const Result<FileAttributes> folder = files().attributesOfItem(at("folder"));
  ASSERT_TRUE(folder.ok());
  EXPECT_EQ(folder->size, 0U);
  EXPECT_TRUE(folder->isDirectory);
}

TEST_P(FileSystemContract, AttributesFollowLinks) {
  write("file", "12345");
  if (!subject().makeLink(at("link"), "file")) GTEST_SKIP() << "no links";
  const Result<FileAttributes> link = files().attributesOfItem(at("link"));
  ASSERT_TRUE(link.ok());
  EXPECT_EQ(link->size, 5U);
}

TEST_P(FileSystemContract, WhatIsMissingFailsWithTheSystemsNumberAndNamesThePath) {
  const std::optional<Error> attributes = errorOf(files().attributesOfItem(at("missing")));
  EXPECT_TRUE(failsWith(ENOENT, attributes));
  EXPECT_NE(attributes->text.find(at("missing")), std::string::npos) << attributes->text;
  const std::optional<Error> contents = errorOf(files().readFile(at("missing")));
  EXPECT_TRUE(failsWith(ENOENT, contents));
  EXPECT_NE(contents->text.find(at("missing")), std::string::npos) << contents->text;
}

TEST_P(FileSystemContract, AFolderCannotBeRead) {
  makeFolder("folder");
  EXPECT_TRUE(failsWith(EISDIR, errorOf(files().readFile(at("folder")))));
}

// Writing.

TEST_P(FileSystemContract, AWriteReplacesAFile) {
  write("file", "a long first text");
  write("file", "second");
  EXPECT_EQ(read("file"), "second");
}

TEST_P(FileSystemContract, AWriteNeedsTheParent) {
  EXPECT_TRUE(failsWith(ENOENT, errorOf(files().writeFileAtomically(at("missing/file"), bytesOf("x")))));
  EXPECT_FALSE(exists("missing"));
}

TEST_P(FileSystemContract, AWriteDoesNotReplaceAFolder) {
  makeFolder("folder");
  write("folder/file", "kept");
  EXPECT_FALSE(files().writeFileAtomically(at("folder"), bytesOf("x")).ok());
  EXPECT_EQ(read("folder/file"), "kept");
}

TEST_P(FileSystemContract, AWriteBelowAFileFails) {
  write("file", "kept");
  EXPECT_TRUE(failsWith(ENOTDIR, errorOf(files().writeFileAtomically(at("file/below"), bytesOf("x")))));
  EXPECT_EQ(read("file"), "kept");
}

TEST_P(FileSystemContract, AReaderFindsTheOldBytesOrTheNew) {
  write("file", patternOf('a'));
  std::atomic<bool> isDone = false;
  runOnThreads(3, [&](std::size_t index) {
    if (index == 0) {
      for (int round = 0; round < 50; ++round)
        write("file", patternOf(round % 2 == 0 ? 'b' : 'a'));
      isDone = true;
      return;
    }
    do {
      const std::string text = read("file");
      ASSERT_TRUE(isOnePattern(text)) << text.substr(0, 20) << " of " << text.size();
    } while (!isDone);
  });
}

TEST_P(FileSystemContract, TwoWritersOfOnePathDoNotMix) {
  runOnThreads(4, [&](std::size_t index) {
    for (int round = 0; round < 20; ++round)
      write("file", patternOf(static_cast<char>('a' + index)));
  });
  EXPECT_TRUE(isOnePattern(read("file")));
}

TEST_P(FileSystemContract, CreatingAFileMakesItAndReplacesIt) {
  EXPECT_TRUE(files().createFile(at("file"), bytesOf("a long first text"), {}).ok());
  EXPECT_EQ(read("file"), "a long first text");
  EXPECT_TRUE(files().createFile(at("file"), bytesOf("second"), {}).ok());
  EXPECT_EQ(read("file"), "second");
}

TEST_P(FileSystemContract, CreatingAFileNeedsTheParent) {
  EXPECT_TRUE(failsWith(ENOENT, errorOf(files().createFile(at("missing/file"), bytesOf("x"), {}))));
  EXPECT_FALSE(exists("missing"));
}

TEST_P(FileSystemContract, ACreatedFileBelongsToTheGivenAccounts) {
  const OwnerAttributes owners{"mobile", "mobile"};
  ASSERT_TRUE(files().createFile(at("file"), bytesOf("x"), owners).ok());
  const std::optional<OwnerAttributes> kept = subject().ownersOf(at("file"));
  if (!kept) GTEST_SKIP() << "owners cannot be told";
  EXPECT_EQ(*kept, owners);
}

TEST_P(FileSystemContract, AReplacedFileBelongsToTheNewAccounts) {
  ASSERT_TRUE(files().createFile(at("file"), bytesOf("x"), {"mobile", "mobile"}).ok());
  ASSERT_TRUE(files().createFile(at("file"), bytesOf("x"), {"root", "wheel"}).ok());
  const std::optional<OwnerAttributes> kept = subject().ownersOf(at("file"));
  if (!kept) GTEST_SKIP() << "owners cannot be told";
  EXPECT_EQ(*kept, (OwnerAttributes{"root", "wheel"}));
}

TEST_P(FileSystemContract, ManyThreadsMayWorkAtOnce) {
  runOnThreads(10, [&](std::size_t index) {
    const std::string name = "file" + std::to_string(index);
    for (int round = 0; round < 20; ++round) {
      write(name, name);
      EXPECT_EQ(read(name), name);
      EXPECT_TRUE(files().moveItem(at(name), at(name + "moved")).ok());
      EXPECT_TRUE(files().removeItem(at(name + "moved")).ok());
    }
  });
}

}  // namespace appsync::test
