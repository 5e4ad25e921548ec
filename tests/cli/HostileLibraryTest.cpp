// Malicious and damaged libraries.
#include <filesystem>

#include <gmock/gmock.h>
#include <sys/inotify.h>
#include <sys/stat.h>

#include "device/storage/FileDescriptor.h"
#include "platform/Keys.h"
#include "plist/PropertyList.h"
#include "tests/support/ToolFixture.h"

namespace appsync::test {

namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using testing::UnorderedElementsAre;

class HostileLibrary : public ToolFixtureOfEachMode {
 protected:
  /// Adds a package with this "Info.plist".
  void publishInfo(const std::string& fileName, const plist::Dictionary& info) const {
    const Result<Bytes> document = plist::writeBinary(info);
    ASSERT_TRUE(document.ok());
    write(library() + "/" + fileName,
          zipArchive({{"Notes.app/Info.plist", std::string(textOf(*document))}, {"Notes.app/Icon.png", "a picture"}}));
  }
  void expectOneFailure(const Finished& run) const {
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(endsIn(run.out).size(), 1U);
    EXPECT_EQ(eventsIn(run.out).back().at("failed").size(), 1U);
    EXPECT_THAT(apps(), IsEmpty());
  }
};

INSTANTIATE_TEST_SUITE_P(Modes, HostileLibrary, kModes, nameOfMode);

TEST_P(HostileLibrary, RefusesPathAsIdentifier) {
  for (const char* identifier : {"../../escape", "/etc/passwd", "..", "a/../../b", ""}) {
    publishInfo("bad.zip", {{platform::BundleIdentifierKey, identifier}});
    expectOneFailure(sync({"--json"}));
  }
  EXPECT_FALSE(std::filesystem::exists(path("escape")));
}

TEST_P(HostileLibrary, RefusesHugeIdentifier) {
  publishInfo("bad.zip", {{platform::BundleIdentifierKey, std::string(65536, 'x')}});
  expectOneFailure(sync({"--json"}));
}

TEST_P(HostileLibrary, RefusesNonStringIdentifier) {
  publishInfo("bad.zip", {{platform::BundleIdentifierKey, 7}});
  expectOneFailure(sync({"--json"}));
}

TEST_P(HostileLibrary, RefusesInfoInInvalidUTF8) {
  write(library() + "/bad.zip",
        zipArchive({{"Notes.app/Info.plist",
                     "<plist><dict><key>BundleIdentifier</key><string>org.\xff</string></dict></plist>"}}));
  expectOneFailure(sync({"--json"}));
}

TEST_P(HostileLibrary, EscapesNames) {
  publishInfo("app.zip", {{platform::BundleIdentifierKey, "org.a"},
                          {platform::kBundleVersionKey, "1\x1b[2J"},
                          {platform::kBundleDisplayNameKey, "\x1b]0;owned\x07\n"}});
  const Finished run = sync();
  EXPECT_EQ(run.status, 0);
  EXPECT_THAT(run.out, Not(HasSubstr("\x1b")));
  EXPECT_THAT(run.out, HasSubstr("\\x1b]0;owned\\x07\\x0a 1\\x1b[2J"));
  EXPECT_THAT(runTool({"apps", device()}).out, Not(HasSubstr("\x1b")));
}

TEST_P(HostileLibrary, EscapesFileNames) {
  write(library() + "/\x1b[31m\xff.zip", "nothing");
  const Finished run = sync();
  EXPECT_EQ(run.status, 1);
  EXPECT_THAT(run.err, Not(HasSubstr("\x1b")));
  EXPECT_EQ(eventsIn(sync({"--json"}).out).size(), 2U);
}

TEST_P(HostileLibrary, StagesNoIconOutsideTheApp) {
  publishInfo("app.zip", {{platform::BundleIdentifierKey, "org.a"},
                          {platform::kBundleVersionKey, "1.0"},
                          {platform::kBundleIconFileKey, "../../../../../Library/ApplicationSync/RestoreState.plist"}});
  EXPECT_EQ(sync().status, 0);
  EXPECT_FALSE(std::filesystem::exists(device() + "/root/var/mobile/Library/ApplicationSync/RestoreState.plist"));
}

TEST_P(HostileLibrary, RefusesEntryOutsideTheApp) {
  publish("org.a", "1.0", {{"../../../escape", "x"}});
  expectOneFailure(sync({"--json"}));
}

TEST_P(HostileLibrary, IgnoresOtherFiles) {
  std::filesystem::create_directory(library() + "/folder.zip");
  write(library() + "/.hidden.zip", "x");
  write(library() + "/README", "read me");
  EXPECT_EQ(sync().out, "Nothing to do.\n");
}

TEST_P(HostileLibrary, DetectsPackageByContent) {
  write(library() + "/notes-package", appPackage("org.a"));
  EXPECT_THAT(endsIn(sync({"--json"}).out), ElementsAre("installed org.a"));
}

TEST_P(HostileLibrary, SeparatesBrokenPackageFromAppOfSameName) {
  publish("org.a");
  write(library() + "/org.a", "PK\x03\x04");
  Finished run = sync({"--json"});
  EXPECT_THAT(endsIn(run.out), UnorderedElementsAre("failed org.a", "installed org.a"));
  EXPECT_EQ(run.status, 1);
  run = sync({"--json"});
  EXPECT_THAT(endsIn(run.out), UnorderedElementsAre("failed org.a", "skipped org.a"));
  EXPECT_EQ(run.status, 1);
}

TEST_P(HostileLibrary, AcceptsUpperCaseSuffix) {
  write(library() + "/NOTES.ZIP", appPackage("org.a"));
  EXPECT_THAT(endsIn(sync({"--json"}).out), ElementsAre("installed org.a"));
}

TEST_P(HostileLibrary, DoesNotWaitForPipe) {
  ASSERT_EQ(::mkfifo((library() + "/pipe.zip").c_str(), 0600), 0);
  EXPECT_THAT(endsIn(sync({"--json"}).out), ElementsAre("failed pipe.zip"));
}

TEST_P(HostileLibrary, DanglingLinkFails) {
  std::filesystem::create_symlink("nowhere", library() + "/link.zip");
  EXPECT_THAT(endsIn(sync({"--json"}).out), ElementsAre("failed link.zip"));
}

TEST_P(HostileLibrary, FollowsLinkToPackage) {
  write(path("elsewhere"), appPackage("org.a"));
  std::filesystem::create_symlink(path("elsewhere"), library() + "/link.zip");
  EXPECT_THAT(endsIn(sync({"--json"}).out), ElementsAre("installed org.a"));
}

TEST_P(HostileLibrary, RefusesMissingLibrary) {
  const Finished run = runTool({"sync", device(), path("nowhere")});
  EXPECT_EQ(run.status, 3);
  EXPECT_THAT(run.err, HasSubstr("nowhere"));
}

TEST_P(HostileLibrary, RefusesFileAsLibrary) {
  write(path("file"), "x");
  EXPECT_EQ(runTool({"sync", device(), path("file")}).status, 3);
}

class LargeLibrary : public ToolFixture {};

/// Counts how often files of a folder are opened; the system may merge consecutive events of one file.
class OpeningCounter {
 public:
  explicit OpeningCounter(const std::string& folder) { ::inotify_add_watch(events_.get(), folder.c_str(), IN_OPEN); }
  [[nodiscard]] int count() const {
    alignas(inotify_event) char buffer[65536];
    int openings = 0;
    for (ssize_t length = 0; (length = ::read(events_.get(), buffer, sizeof buffer)) > 0;) {
      for (ssize_t start = 0; start < length;) {
        const auto* event = reinterpret_cast<const inotify_event*>(buffer + start);
        openings += (event->mask & IN_OPEN) != 0 && (event->mask & IN_ISDIR) == 0;
        start += static_cast<ssize_t>(sizeof *event + event->len);
      }
    }
    return openings;
  }

 private:
  const device::FileDescriptor events_{::inotify_init1(IN_CLOEXEC | IN_NONBLOCK)};
};

TEST_F(LargeLibrary, OpensEachPackageAFewTimes) {
  constexpr int kPackages = 500;
  constexpr int kMostOpenings = 2;  // for the info dictionary and for the icon
  publish("org.a");
  ASSERT_EQ(sync().status, 0);
  for (int number = 1; number < kPackages; ++number)
    std::filesystem::create_hard_link(library() + "/org.a-1.0.zip",
                                      library() + "/copy-" + std::to_string(number) + ".zip");
  const OpeningCounter openings(library());
  EXPECT_EQ(sync().out, "Nothing to do: 1 up to date.\n");
  const int count = openings.count();
  EXPECT_GE(count, kPackages);
  EXPECT_LE(count, kPackages * kMostOpenings);
}

}  // namespace

}  // namespace appsync::test
