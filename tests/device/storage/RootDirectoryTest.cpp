// Paths never lead outside a device, whatever links it contains and whatever changes concurrently.
#include <atomic>
#include <cerrno>
#include <filesystem>
#include <string>

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include "device/storage/FileTree.h"
#include "device/storage/RootDirectory.h"
#include "kit/fakes/Threads.h"
#include "tests/support/TestDevice.h"

namespace appsync::test {

using device::FileDescriptor;
using device::Resolution;
using device::RootDirectory;

namespace {

namespace fs = std::filesystem;

class RootDirectoryTest : public testing::TestWithParam<Resolution> {
 protected:
  RootDirectoryTest() {
    fs::create_directories(host("var/mobile"));
    writeHostFile(host("var/mobile/file"), "inside");
    writeHostFile(folder_.path("secret"), "outside");
    fs::create_directories(folder_.path("elsewhere"));
    writeHostFile(folder_.path("elsewhere/file"), "outside");
  }

  [[nodiscard]] std::string host(const std::string& path) const { return folder_.path("root/" + path); }
  [[nodiscard]] RootDirectory root() const {
    Result<RootDirectory> opened = RootDirectory::open(folder_.path("root"), GetParam());
    EXPECT_TRUE(opened.ok());
    return std::move(opened).value();
  }
  /// Returns the content of the file at a path, or the errno value of the failure.
  [[nodiscard]] std::string at(const std::string& path) const {
    const Result<FileDescriptor> file = root().open(path, O_RDONLY);
    if (!file) return std::to_string(file.error().code);
    Bytes bytes;
    const int failed = device::tree::read(file->get(), 1000, bytes);
    return failed == 0 ? std::string(textOf(bytes)) : std::to_string(failed);
  }
  void link(const std::string& path, const std::string& target) { fs::create_symlink(target, host(path)); }
  static std::string number(int error) { return std::to_string(error); }

  TemporaryFolder folder_;
};

constexpr auto nameOfResolution = [](const auto& resolution) {
  return std::string(resolution.param == Resolution::kernel ? "Kernel" : "Componentwise");
};

INSTANTIATE_TEST_SUITE_P(EachWay, RootDirectoryTest, testing::Values(Resolution::kernel, Resolution::componentwise),
                         nameOfResolution);

}  // namespace

TEST_P(RootDirectoryTest, OpensPathsInside) {
  EXPECT_EQ(at("/var/mobile/file"), "inside");
  EXPECT_EQ(at("//var///mobile/./file"), "inside");
  EXPECT_EQ(at("/var/mobile/../mobile/file"), "inside");
  EXPECT_EQ(at("/"), number(EISDIR));
  EXPECT_EQ(at("/var/missing"), number(ENOENT));
  EXPECT_EQ(at("/var/mobile/file/below"), number(ENOTDIR));
}

TEST_P(RootDirectoryTest, RejectsPathsLeadingOutside) {
  for (const char* path :
       {"/../secret", "/..", "/var/../../secret", "/var/mobile/../../../secret", "/../root/var/mobile/file"}) {
    EXPECT_EQ(at(path), number(EXDEV)) << path;
  }
  const auto opened = root().open("/../secret", O_RDONLY);
  EXPECT_EQ(opened.error().text, "/../secret: leads outside the device");
}

TEST_P(RootDirectoryTest, RejectsInvalidPaths) {
  EXPECT_EQ(at(""), number(ENOENT));
  EXPECT_EQ(at("var/mobile/file"), number(EINVAL));
  EXPECT_EQ(at(std::string("/var\0/x", 7)), number(EINVAL));
}

TEST_P(RootDirectoryTest, FollowsLinksInside) {
  link("var/file", "mobile/file");
  link("var/folder", "mobile");
  link("var/mobile/up", "../mobile/file");
  link("var/chain", "folder/up");
  EXPECT_EQ(at("/var/file"), "inside");
  EXPECT_EQ(at("/var/folder/file"), "inside");
  EXPECT_EQ(at("/var/mobile/up"), "inside");
  EXPECT_EQ(at("/var/chain"), "inside");
  EXPECT_EQ(at("/var/folder/../mobile/file"), "inside");
}

TEST_P(RootDirectoryTest, RejectsLinksLeadingOutside) {
  link("relative", "../secret");
  link("absolute", folder_.path("secret"));
  link("home", "/var/mobile/file");
  link("var/folder", "../..");
  link("var/elsewhere", folder_.path("elsewhere"));
  link("first", "var/folder/secret");
  for (const char* path :
       {"/relative", "/absolute", "/home", "/var/folder", "/var/folder/secret", "/var/elsewhere/file", "/first"}) {
    EXPECT_EQ(at(path), number(EXDEV)) << path;
  }
}

TEST_P(RootDirectoryTest, RejectsLinkCycles) {
  link("a", "b");
  link("b", "a");
  link("c", "c/x");
  EXPECT_EQ(at("/a"), number(ELOOP));
  EXPECT_EQ(at("/c"), number(ELOOP));
  EXPECT_EQ(at("/a/file"), number(ELOOP));
}

TEST_P(RootDirectoryTest, DanglingLinksFail) {
  link("dangling", "missing/file");
  EXPECT_EQ(at("/dangling"), number(ENOENT));
}

TEST_P(RootDirectoryTest, PlaceIsNameInDirectory) {
  const auto place = root().place("/var/mobile/new/");
  ASSERT_TRUE(place.ok());
  EXPECT_EQ(place->name, "new");
  struct stat found {};
  EXPECT_EQ(fstatat(place->folder.get(), "file", &found, 0), 0);
  for (const char* path : {"/", "/var/..", "/var/.", "///"})
    EXPECT_EQ(root().place(path).error().code, EBUSY) << path;
  EXPECT_EQ(root().place("").error().code, ENOENT);
  EXPECT_EQ(root().place("file").error().code, EINVAL);
  EXPECT_EQ(root().place("/../new").error().code, EXDEV);
  EXPECT_EQ(root().place("/missing/new").error().code, ENOENT);
}

TEST_P(RootDirectoryTest, PlaceMayBeDanglingLink) {
  link("out", "../secret");
  EXPECT_EQ(root().place("/out")->name, "out");
}

TEST_P(RootDirectoryTest, ConcurrentRenamesNeverLeadOutside) {
  // One thread keeps exchanging a directory for a link that leads outside; the other must never open its target.
  fs::create_directory(host("swap"));
  writeHostFile(host("swap/file"), "inside");
  link("way", folder_.path("elsewhere"));
  const RootDirectory opened = root();
  const FileDescriptor folder(::open(folder_.path("root").c_str(), O_RDONLY | O_DIRECTORY));
  std::atomic<bool> isDone = false;
  runOnThreads(2, [&](std::size_t index) {
    if (index == 1) {
      while (!isDone)
        renameat2(folder.get(), "swap", folder.get(), "way", RENAME_EXCHANGE);
      return;
    }
    for (int round = 0; round < 5000; ++round) {
      const Result<FileDescriptor> file = opened.open("/swap/../swap/file", O_RDONLY);
      if (!file) continue;
      char text[16] = {};
      EXPECT_EQ(read(file->get(), text, sizeof text), 6);
      EXPECT_STREQ(text, "inside");
    }
    isDone = true;
  });
}

}  // namespace appsync::test
