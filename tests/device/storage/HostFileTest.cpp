#include <cerrno>
#include <filesystem>
#include <iterator>
#include <string>
#include <string_view>

#include <gtest/gtest.h>
#include <sys/stat.h>

#include "device/storage/FileDescriptor.h"
#include "device/storage/HostFile.h"
#include "device/storage/SystemCalls.h"
#include "kit/fakes/TemporaryFolder.h"
#include "tests/device/InjectedFault.h"
#include "tests/support/NamedPipe.h"
#include "tests/support/TestDevice.h"

namespace appsync::test {
namespace {

namespace fs = std::filesystem;

std::ptrdiff_t filesIn(const std::string& folder) {
  return std::distance(fs::directory_iterator(folder), fs::directory_iterator());
}

mode_t modeOf(const std::string& path) {
  struct stat found = {};
  EXPECT_EQ(::lstat(path.c_str(), &found), 0) << path;
  return found.st_mode & 07777U;
}

Error badFile(int number, const std::string& text) {
  return {std::string(domains::kPOSIX), number, text, nullptr};
}

TEST(ReplaceHostFile, CreatesAndReplacesFiles) {
  const TemporaryFolder folder;
  EXPECT_TRUE(device::replaceHostFile(folder.path("file"), bytesOf("first")));
  EXPECT_EQ(readHostFile(folder.path("file")), "first");
  EXPECT_TRUE(device::replaceHostFile(folder.path("file"), bytesOf("2")));
  EXPECT_EQ(readHostFile(folder.path("file")), "2");
  EXPECT_EQ(filesIn(folder.path()), 1);
}

TEST(ReplaceHostFile, FailureNamesPathAndLeavesNothing) {
  const TemporaryFolder folder;
  const Status missing = device::replaceHostFile(folder.path("missing/file"), bytesOf("x"));
  ASSERT_FALSE(missing);
  EXPECT_EQ(missing.error(), Error::fromErrno(ENOENT, folder.path("missing/file") + " cannot be written"));
  fs::create_directory(folder.path("folder"));
  const Status onFolder = device::replaceHostFile(folder.path("folder"), bytesOf("x"));
  ASSERT_FALSE(onFolder);
  EXPECT_EQ(onFolder.error().code, EISDIR);
  EXPECT_EQ(filesIn(folder.path()), 1);
}

TEST(ReplaceHostFile, KeepsModeOfReplacedFile) {
  const TemporaryFolder folder;
  for (const mode_t mode : {0600U, 0444U, 0755U}) {
    writeHostFile(folder.path("file"), "secret");
    ASSERT_EQ(::chmod(folder.path("file").c_str(), mode), 0);
    EXPECT_TRUE(device::replaceHostFile(folder.path("file"), bytesOf("new")));
    EXPECT_EQ(modeOf(folder.path("file")), mode);
    fs::remove(folder.path("file"));
  }
}

TEST(ReplaceHostFile, RetriesIfTemporaryNameExists) {
  static int takenTimes;
  takenTimes = 2;
  const TemporaryFolder folder;
  const Status replaced = withFaultHook(
      [](const char* name) { return std::string_view(name) == "create file" && takenTimes-- > 0 ? EEXIST : 0; },
      [&] { return device::replaceHostFile(folder.path("file"), bytesOf("x")); });
  EXPECT_TRUE(replaced) << replaced.error().text;
  EXPECT_EQ(readHostFile(folder.path("file")), "x");
}

TEST(ReplaceHostFile, RemovesOnlyIncompleteFilesAfterCrash) {
  const TemporaryFolder folder;
  EXPECT_FALSE(withFaultHook(
      [](const char* name) {
        const std::string_view faultPoint = name;
        return faultPoint == "rename" || faultPoint == "remove file" ? EIO : 0;
      },
      [&] { return device::replaceHostFile(folder.path("file"), bytesOf("x")); }));
  ASSERT_EQ(filesIn(folder.path()), 1);
  for (const char* name : {".draft-0123456789abcdef", "file.draft-0123456789abcdeg", "file.draft-0123456789abcde",
                           "file.0123456789abcdef", "file.draft-0123456789abcdef.plist"}) {
    writeHostFile(folder.path(name), "somebody's");
  }
  const device::FileDescriptor opened(::open(folder.path().c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  device::removeHostFileDrafts(opened.get());
  EXPECT_EQ(filesIn(folder.path()), 5);
}

TEST(WriteHostFile, ReplacesTargetOfLink) {
  const TemporaryFolder folder;
  fs::create_directory(folder.path("there"));
  fs::create_symlink("there/link", folder.path("link"));
  fs::create_symlink("file", folder.path("there/link"));
  for (const char* content : {"made", "replaced"}) {
    EXPECT_TRUE(device::writeHostFile(folder.path("link"), bytesOf(content)));
    EXPECT_EQ(readHostFile(folder.path("there/file")), content);
  }
  EXPECT_TRUE(fs::is_symlink(folder.path("link")));
  EXPECT_TRUE(fs::is_symlink(folder.path("there/link")));
  EXPECT_EQ(filesIn(folder.path("there")), 2);
}

TEST(WriteHostFile, RejectsLinkCycles) {
  const TemporaryFolder folder;
  fs::create_symlink("two", folder.path("one"));
  fs::create_symlink("one", folder.path("two"));
  const Status written = device::writeHostFile(folder.path("one"), bytesOf("x"));
  ASSERT_FALSE(written);
  EXPECT_EQ(written.error(), Error::fromErrno(ELOOP, folder.path("one") + " cannot be written"));
  EXPECT_TRUE(fs::is_symlink(folder.path("one")));
}

TEST(WriteHostFile, WritesToPipe) {
  const TemporaryFolder folder;
  const NamedPipe pipe(folder.path("pipe"));
  EXPECT_TRUE(device::writeHostFile(folder.path("pipe"), bytesOf("all at once")));
  EXPECT_EQ(pipe.contents(), "all at once");
  const auto fill = [](int file) -> Status {
    EXPECT_EQ(device::sys::writeAt(file, bytesOf("filled"), 0), 0);
    return {};
  };
  EXPECT_TRUE(device::writeHostFile(folder.path("pipe"), fill));
  EXPECT_EQ(pipe.contents(), "filled");
  EXPECT_TRUE(pipe.isThere());
  EXPECT_EQ(filesIn(folder.path()), 1);
}

TEST(WriteHostFile, FailedFillChangesNothing) {
  const TemporaryFolder folder;
  const Error reason = badFile(EIO, "it broke");
  const auto fill = [&](int file) -> Status {
    EXPECT_EQ(device::sys::writeAt(file, bytesOf("half"), 0), 0);
    return reason;
  };
  writeHostFile(folder.path("file"), "before");
  const NamedPipe pipe(folder.path("pipe"));
  for (const char* name : {"file", "pipe", "new"}) {
    const Status written = device::writeHostFile(folder.path(name), fill);
    ASSERT_FALSE(written) << name;
    EXPECT_EQ(written.error(), reason) << name;
  }
  EXPECT_EQ(readHostFile(folder.path("file")), "before");
  EXPECT_EQ(pipe.contents(), "");
  EXPECT_EQ(filesIn(folder.path()), 2);
}

TEST(ReadHostFile, RejectsPipesWithoutWaiting) {
  const TemporaryFolder folder;
  makePipe(folder.path("pipe"));
  EXPECT_EQ(device::readHostFile(folder.path("pipe")).error(),
            badFile(EINVAL, folder.path("pipe") + " cannot be read: it is a pipe or a device, not a file"));
  EXPECT_EQ(device::readHostFile("/dev/zero").error().code, EINVAL);
  EXPECT_EQ(device::readHostFile(folder.path()).error(), Error::fromErrno(EISDIR, folder.path() + " cannot be read"));
}

TEST(ReadHostFile, RejectsFileAboveLimit) {
  const TemporaryFolder folder;
  writeHostFile(folder.path("file"), "");
  fs::resize_file(folder.path("file"), 2'000'000);
  EXPECT_EQ(device::readHostFile(folder.path("file"), 2'000'000).value().size(), 2'000'000U);
  EXPECT_EQ(device::readHostFile(folder.path("file"), 1'999'999).error(),
            badFile(EFBIG, folder.path("file") + " cannot be read: it has more than 1 MB"));
}

TEST(ReadHostStream, RejectsEndlessStream) {
  EXPECT_EQ(device::readHostStream("/dev/zero", 3'000'000).error(),
            badFile(EFBIG, "/dev/zero cannot be read: it has more than 3 MB"));
}

}  // namespace
}  // namespace appsync::test
