// Standard streams: terminals of all kinds, and closed streams.
#include <filesystem>

#include <gmock/gmock.h>

#include "tests/support/TestDevice.h"
#include "tests/support/ToolFixture.h"

namespace appsync::test {

namespace {

using testing::HasSubstr;
using testing::Not;

class Streams : public ToolFixture {
 protected:
  /// Runs a shell command in which $0 is the device and $1 the library.
  [[nodiscard]] Finished shell(const std::string& line) const {
    return runProgram("sh", {"-c", line, device(), library()});
  }
  /// Runs a shell command on a terminal of this kind and returns its output.
  [[nodiscard]] Finished onTerminal(const std::string& line, const std::string& kind) const {
    return runProgram("script", {"-qec", line, "/dev/null"}, {.environment = {{"TERM", kind}}});
  }
};

TEST_F(Streams, DeviceFilesNeverReceiveMessages) {
  write(library() + "/broken.zip", "no package");
  for (const std::string closed : {"2>&-", ">&- 2>&-", "<&- >&- 2>&-"}) {
    EXPECT_NE(shell("appsync sync $0 $1 " + closed).status, 0);
    EXPECT_THAT(readHostFile(device() + "/lock"), testing::MatchesRegex("[0-9]+\n")) << closed;
  }
}

TEST_F(Streams, ClosedStreamsAreErrors) {
  EXPECT_EQ(shell("appsync plist - <&-").err, "appsync: - cannot be read: Bad file descriptor\n");
  EXPECT_EQ(shell("appsync apps $0 >&-").err, "appsync: standard output cannot be written: Bad file descriptor\n");
}

TEST_F(Streams, DumbTerminalGetsPlainLines) {
  publish("org.a");
  const std::string line = "appsync sync " + device() + " " + library();
  const Finished plain = onTerminal(line, "dumb");
  EXPECT_EQ(plain.status, 0);
  EXPECT_THAT(plain.out, HasSubstr("installed  "));
  EXPECT_THAT(plain.out, Not(HasSubstr("\x1b")));
  publish("org.b");
  EXPECT_THAT(onTerminal(line, "xterm").out, HasSubstr("\x1b"));
}

TEST_F(Streams, RefusesBinaryOutputToTerminal) {
  write(path("list"), "{ a = b; }");
  const Finished list = onTerminal("appsync plist --to binary " + path("list"), "xterm");
  EXPECT_EQ(list.status, 2);
  EXPECT_EQ(list.out, "appsync: a terminal cannot show the binary format; name a file with -o\r\n");
  const Finished picture = onTerminal("appsync screen -o - " + device(), "xterm");
  EXPECT_EQ(picture.status, 2);
  EXPECT_EQ(picture.out, "appsync: a terminal cannot show a picture; name a file with -o\r\n");
  EXPECT_EQ(onTerminal("appsync pack -o - " + path("none"), "xterm").out,
            "appsync: a terminal cannot show a package; name a file with -o\r\n");
}

TEST_F(Streams, RelativeModuleNeedsCurrentFolder) {
  const Finished run = shell(
      "mkdir \"$1/gone\" && cd \"$1/gone\" && rmdir \"$1/gone\" && "
      "APPSYNC_MODULE=lib/AppsClient.so appsync clear $0");
  EXPECT_EQ(run.status, 3);
  EXPECT_EQ(run.err,
            "appsync: the plug-in lib/AppsClient.so cannot be used: the current folder no longer exists; set "
            "APPSYNC_MODULE to an absolute path\n");
}

}  // namespace

}  // namespace appsync::test
