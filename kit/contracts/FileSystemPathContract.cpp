// FileSystemContract: times, the temporary directory, and paths that must fail.
#include <cerrno>
#include <functional>
#include <vector>

#include "kit/contracts/Errors.h"
#include "kit/contracts/FileSystemContract.h"

namespace appsync::test {

using platform::FileAttributes;
using platform::IntermediateDirectories;

namespace {

/// Every operation that takes a path.
std::vector<std::function<std::optional<Error>(platform::FileSystem&, const std::string&)>> operations(
    const std::string& existingFile, const std::string& freePath) {
  using Files = platform::FileSystem;
  using Path = const std::string&;
  return {
      [](Files& files, Path path) { return files.fileExists(path) ? std::nullopt : std::optional<Error>(Error{}); },
      [](Files& files, Path path) { return errorOf(files.attributesOfItem(path)); },
      [](Files& files, Path path) { return errorOf(files.readFile(path)); },
      [](Files& files, Path path) { return errorOf(files.writeFileAtomically(path, bytesOf("x"))); },
      [](Files& files, Path path) { return errorOf(files.createFile(path, bytesOf("x"), {})); },
      [](Files& files, Path path) {
        return errorOf(files.createDirectory(path, IntermediateDirectories::require, {}));
      },
      [](Files& files, Path path) { return errorOf(files.createDirectory(path, IntermediateDirectories::create, {})); },
      [=](Files& files, Path path) { return errorOf(files.copyItem(path, freePath)); },
      [=](Files& files, Path path) { return errorOf(files.copyItem(existingFile, path)); },
      [=](Files& files, Path path) { return errorOf(files.moveItem(path, freePath)); },
      [=](Files& files, Path path) { return errorOf(files.moveItem(existingFile, path)); },
      [](Files& files, Path path) { return errorOf(files.removeItem(path)); },
      [](Files& files, Path path) { return errorOf(files.touch(path)); },
  };
}

}  // namespace

TEST_P(FileSystemContract, TouchSetsTheTimesToNow) {
  write("file", "x");
  makeFolder("folder");
  if (!subject().makeOld(at("file"))) GTEST_SKIP() << "the subject cannot set times";
  ASSERT_TRUE(subject().makeOld(at("folder")));
  ASSERT_TRUE(subject().isOld(at("folder")));
  EXPECT_TRUE(files().touch(at("file")).ok());
  EXPECT_TRUE(files().touch(at("folder")).ok());
  EXPECT_FALSE(subject().isOld(at("file")));
  EXPECT_FALSE(subject().isOld(at("folder")));
}

TEST_P(FileSystemContract, TouchingAMissingItemReturnsTheSystemsText) {
  const Status touched = files().touch(at("missing"));
  ASSERT_TRUE(failsWith(ENOENT, touched.failure()));
  EXPECT_EQ(touched.error().text, Error::fromErrno(ENOENT).text);
  EXPECT_FALSE(exists("missing"));
}

// The temporary directory.

TEST_P(FileSystemContract, TemporaryDirectoryExists) {
  const std::string folder = files().temporaryDirectory();
  ASSERT_FALSE(folder.empty());
  EXPECT_EQ(folder.front(), '/');
  EXPECT_NE(folder.back(), '/');
  const Result<FileAttributes> attributes = files().attributesOfItem(folder);
  ASSERT_TRUE(attributes.ok());
  EXPECT_TRUE(attributes->isDirectory);
  EXPECT_EQ(files().temporaryDirectory(), folder);
}

TEST_P(FileSystemContract, TemporaryDirectoryIsWritable) {
  const std::string path = files().temporaryDirectory() + "/contract-file";
  EXPECT_TRUE(files().writeFileAtomically(path, bytesOf("x")).ok());
  EXPECT_TRUE(files().removeItem(path).ok());
}

// Confinement.

TEST_P(FileSystemContract, PathsOutsideTheDeviceFail) {
  write("file", "kept");
  const std::string way = subject().folder() + std::string("/../../../../../../../../../../../..");
  for (const std::string& path :
       {way, way + "/etc/hostname", way + "/contract-escape", std::string("/../contract-escape")}) {
    for (const auto& operation : operations(at("file"), at("free")))
      EXPECT_TRUE(operation(files(), path)) << path;
  }
  EXPECT_EQ(read("file"), "kept");
  EXPECT_FALSE(exists("free"));
}

TEST_P(FileSystemContract, LinksOutsideTheDeviceFail) {
  write("file", "kept");
  if (!subject().makeLink(at("out"), "../../../../../../../../../../../../.."))
    GTEST_SKIP() << "the subject has no symbolic links";
  for (const auto& operation : operations(at("file"), at("free"))) {
    EXPECT_TRUE(operation(files(), at("out/etc/hostname")));
    EXPECT_TRUE(operation(files(), at("out/contract-escape")));
  }
  EXPECT_TRUE(errorOf(files().readFile(at("out/etc/hostname"))));
  EXPECT_EQ(read("file"), "kept");
}

TEST_P(FileSystemContract, InvalidPathsFail) {
  write("file", "kept");
  const std::string withNull = at("a") + std::string("\0b", 2);
  for (const std::string& path : {std::string(), std::string("relative"), withNull, at(std::string(300, 'x'))}) {
    for (const auto& operation : operations(at("file"), at("free")))
      EXPECT_TRUE(operation(files(), path)) << path;
  }
  EXPECT_EQ(read("file"), "kept");
  EXPECT_FALSE(exists("a"));
}

TEST_P(FileSystemContract, CircularLinksFail) {
  if (!subject().makeLink(at("a"), "b")) GTEST_SKIP() << "the subject has no symbolic links";
  ASSERT_TRUE(subject().makeLink(at("b"), "a"));
  EXPECT_FALSE(exists("a"));
  EXPECT_TRUE(failsWith(ELOOP, errorOf(files().readFile(at("a")))));
}

}  // namespace appsync::test
