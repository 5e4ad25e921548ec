// Malicious files of the host: no command blocks forever or uses a file that it cannot read.
#include <filesystem>

#include <gmock/gmock.h>

#include "tests/support/NamedPipe.h"
#include "tests/support/ToolFixture.h"

namespace appsync::test {

namespace {

using testing::ElementsAre;

class HostileFiles : public ToolFixture {
 protected:
  void SetUp() override {
    ToolFixture::SetUp();
    publish("org.a");
    ASSERT_EQ(sync().status, 0);
  }
  static void expectUnusable(const Finished& run, const std::string& reason) {
    EXPECT_EQ(run.status, 3);
    EXPECT_EQ(run.out, "");
    EXPECT_EQ(run.err, "appsync: " + reason + "\n");
  }
};

TEST_F(HostileFiles, DoesNotWaitForPipeAsLicence) {
  makePipe(path("pipe"));
  expectUnusable(runTool({"set", device(), "licence=org.a:" + path("pipe")}),
                 path("pipe") + " cannot be read: it is a pipe or a device, not a file");
}

TEST_F(HostileFiles, LimitsTheSizeOfALicence) {
  write(path("licence"), "");
  std::filesystem::resize_file(path("licence"), 16'000'001);
  expectUnusable(runTool({"set", device(), "licence=org.a:" + path("licence")}),
                 path("licence") + " cannot be read: it has more than 16 MB");
}

TEST_F(HostileFiles, DoesNotWaitForPipeAsManifest) {
  std::filesystem::create_directory(path("backup"));
  makePipe(path("backup/Manifest.plist"));
  expectUnusable(runTool({"restore", device(), path("backup")}),
                 path("backup") + " is not a usable backup: " + path("backup/Manifest.plist") +
                     " cannot be read: it is a pipe or a device, not a file; name a folder that "
                     "`appsync backup` created");
}

TEST_F(HostileFiles, ReportsLogPipeWithoutReader) {
  makePipe(path("pipe"));
  expectUnusable(sync({"--log", path("pipe")}),
                 "cannot open log file \"" + path("pipe") + "\": the pipe has no reader; start its reader first");
}

TEST_F(HostileFiles, KeepsUnreadableHostState) {
  ASSERT_EQ(sync({"--remove", "org.a"}).status, 0);
  const std::string state = device() + "/host-state.plist";
  write(state, "{");
  const Finished run = sync();
  EXPECT_EQ(run.status, 3);
  EXPECT_THAT(run.err, testing::StartsWith("appsync: " + state + " is damaged ("));
  EXPECT_THAT(apps(), ElementsAre());
  EXPECT_EQ(std::filesystem::file_size(state), 1U);
  std::filesystem::remove(state);
  EXPECT_EQ(sync().status, 0);
  EXPECT_THAT(apps(), ElementsAre("org.a 1.0"));
}

}  // namespace

}  // namespace appsync::test
