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

// Reading.

TEST_P(FileSystemContract, ReadsBackAFile) {
  const std::string text("a\0b\xff\n", 5);
  write("file", text);
  EXPECT_EQ(read("file"), text);
}

TEST_P(FileSystemContract, EmptyFileExists) {
  write("file", "");
  EXPECT_TRUE(exists("file"));
  EXPECT_EQ(read("file"), "");
}

TEST_P(FileSystemContract, ReadsALargeFile) {
  const std::string text(3'000'001, 'x');
  write("file", text);
  EXPECT_EQ(read("file"), text);
}

TEST_P(FileSystemContract, OnlyFilesAndDirectoriesExist) {
  write("file", "x");
  makeFolder("folder");
  EXPECT_TRUE(exists("file"));
  EXPECT_TRUE(exists("folder"));
  EXPECT_FALSE(exists("other"));
  EXPECT_FALSE(exists("file/below"));
}

TEST_P(FileSystemContract, LinkExistsIfItsTargetExists) {
  write("file", "x");
  if (!subject().makeLink(at("link"), "file")) GTEST_SKIP() << "the subject has no symbolic links";
  ASSERT_TRUE(subject().makeLink(at("dangling"), "missing"));
  EXPECT_TRUE(exists("link"));
  EXPECT_FALSE(exists("dangling"));
}

TEST_P(FileSystemContract, AttributesAreSizeAndKind) {
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
  if (!subject().makeLink(at("link"), "file")) GTEST_SKIP() << "the subject has no symbolic links";
  const Result<FileAttributes> link = files().attributesOfItem(at("link"));
  ASSERT_TRUE(link.ok());
  EXPECT_EQ(link->size, 5U);
}

TEST_P(FileSystemContract, MissingItemFailsWithPOSIXErrorNamingThePath) {
  const std::optional<Error> attributes = errorOf(files().attributesOfItem(at("missing")));
  EXPECT_TRUE(failsWith(ENOENT, attributes));
  EXPECT_NE(attributes->text.find(at("missing")), std::string::npos) << attributes->text;
  const std::optional<Error> contents = errorOf(files().readFile(at("missing")));
  EXPECT_TRUE(failsWith(ENOENT, contents));
  EXPECT_NE(contents->text.find(at("missing")), std::string::npos) << contents->text;
}

TEST_P(FileSystemContract, ReadingADirectoryFails) {
  makeFolder("folder");
  EXPECT_TRUE(failsWith(EISDIR, errorOf(files().readFile(at("folder")))));
}

// Writing.

TEST_P(FileSystemContract, WriteReplacesAFile) {
  write("file", "a long first text");
  write("file", "second");
  EXPECT_EQ(read("file"), "second");
}

TEST_P(FileSystemContract, WriteNeedsTheParent) {
  EXPECT_TRUE(failsWith(ENOENT, errorOf(files().writeFileAtomically(at("missing/file"), bytesOf("x")))));
  EXPECT_FALSE(exists("missing"));
}

TEST_P(FileSystemContract, WriteDoesNotReplaceADirectory) {
  makeFolder("folder");
  write("folder/file", "kept");
  EXPECT_FALSE(files().writeFileAtomically(at("folder"), bytesOf("x")).ok());
  EXPECT_EQ(read("folder/file"), "kept");
}

TEST_P(FileSystemContract, WriteBelowAFileFails) {
  write("file", "kept");
  EXPECT_TRUE(failsWith(ENOTDIR, errorOf(files().writeFileAtomically(at("file/below"), bytesOf("x")))));
  EXPECT_EQ(read("file"), "kept");
}

TEST_P(FileSystemContract, WriteIsAtomicForReaders) {
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

TEST_P(FileSystemContract, ConcurrentWritesDoNotMix) {
  runOnThreads(4, [&](std::size_t index) {
    for (int round = 0; round < 20; ++round)
      write("file", patternOf(static_cast<char>('a' + index)));
  });
  EXPECT_TRUE(isOnePattern(read("file")));
}

TEST_P(FileSystemContract, CreatesAndReplacesAFile) {
  EXPECT_TRUE(files().createFile(at("file"), bytesOf("a long first text"), {}).ok());
  EXPECT_EQ(read("file"), "a long first text");
  EXPECT_TRUE(files().createFile(at("file"), bytesOf("second"), {}).ok());
  EXPECT_EQ(read("file"), "second");
}

TEST_P(FileSystemContract, CreatingAFileNeedsTheParent) {
  EXPECT_TRUE(failsWith(ENOENT, errorOf(files().createFile(at("missing/file"), bytesOf("x"), {}))));
  EXPECT_FALSE(exists("missing"));
}

TEST_P(FileSystemContract, CreatedFileHasTheGivenOwners) {
  const OwnerAttributes owners{"mobile", "mobile"};
  ASSERT_TRUE(files().createFile(at("file"), bytesOf("x"), owners).ok());
  const std::optional<OwnerAttributes> kept = subject().ownersOf(at("file"));
  if (!kept) GTEST_SKIP() << "the subject cannot read owners";
  EXPECT_EQ(*kept, owners);
}

TEST_P(FileSystemContract, ReplacedFileHasTheNewOwners) {
  ASSERT_TRUE(files().createFile(at("file"), bytesOf("x"), {"mobile", "mobile"}).ok());
  ASSERT_TRUE(files().createFile(at("file"), bytesOf("x"), {"root", "wheel"}).ok());
  const std::optional<OwnerAttributes> kept = subject().ownersOf(at("file"));
  if (!kept) GTEST_SKIP() << "the subject cannot read owners";
  EXPECT_EQ(*kept, (OwnerAttributes{"root", "wheel"}));
}

TEST_P(FileSystemContract, IsThreadSafe) {
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
