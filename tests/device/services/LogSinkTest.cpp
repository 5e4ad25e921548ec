#include <algorithm>
#include <cerrno>
#include <chrono>
#include <fstream>
#include <string>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include "device/services/LogSink.h"
#include "kit/fakes/TemporaryFolder.h"
#include "tests/support/NamedPipe.h"

namespace appsync::test {
namespace {

using device::FileLogSink;

class FileLogSinkTest : public testing::Test {
 protected:
  std::unique_ptr<FileLogSink> open() {
    auto opened = FileLogSink::open(path);
    EXPECT_TRUE(opened);
    return std::move(opened).value();
  }
  std::vector<std::string> lines() const {
    std::vector<std::string> read;
    std::ifstream file(path);
    for (std::string line; std::getline(file, line);)
      read.push_back(line);
    return read;
  }

  static constexpr std::chrono::system_clock::time_point kTime =
      std::chrono::sys_days(std::chrono::year(2026) / 2 / 3) + std::chrono::hours(4) + std::chrono::minutes(5) +
      std::chrono::seconds(6) + std::chrono::microseconds(7089);

  const TemporaryFolder folder;
  const std::string path = folder.path("sync.log");
};

TEST_F(FileLogSinkTest, ALineIsTimeCategoryLevelAndMessage) {
  const auto sink = open();
  sink->write(kTime, 8, LogLevel::standard, "plug-in|getting installed assets");
  sink->write(kTime, 14, LogLevel::error, "");
  EXPECT_EQ(lines(), (std::vector<std::string>{"2026-02-03T04:05:06.007089Z 8 default plug-in|getting installed assets",
                                               "2026-02-03T04:05:06.007089Z 14 error "}));
}

TEST_F(FileLogSinkTest, LinesAreAppendedToWhatIsThere) {
  open()->write(kTime, 8, LogLevel::standard, "first");
  open()->write(kTime, 8, LogLevel::standard, "second");
  EXPECT_EQ(lines().size(), 2U);
}

TEST_F(FileLogSinkTest, WritesMessagesUnchanged) {
  open()->write(kTime, 8, LogLevel::standard, R"(a\n \x1b é)");
  EXPECT_EQ(lines(), std::vector<std::string>{R"(2026-02-03T04:05:06.007089Z 8 default a\n \x1b é)"});
}

TEST_F(FileLogSinkTest, TimesBeforeTheEpochAreWrittenToo) {
  open()->write(std::chrono::system_clock::time_point(std::chrono::microseconds(-1)), 8, LogLevel::standard, "m");
  EXPECT_EQ(lines(), std::vector<std::string>{"1969-12-31T23:59:59.999999Z 8 default m"});
}

TEST_F(FileLogSinkTest, LinesOfManyThreadsNeverMix) {
  const auto first = open();
  const auto second = open();
  std::vector<std::thread> threads;
  for (int number = 0; number < 4; ++number) {
    threads.emplace_back([&, number] {
      const std::string message(500, static_cast<char>('a' + number));
      for (int line = 0; line < 100; ++line) {
        (number % 2 == 0 ? first : second)->write(kTime, 8, LogLevel::standard, message);
      }
    });
  }
  for (std::thread& thread : threads)
    thread.join();
  const auto written = lines();
  EXPECT_EQ(written.size(), 400U);
  for (int number = 0; number < 4; ++number) {
    const std::string line =
        "2026-02-03T04:05:06.007089Z 8 default " + std::string(500, static_cast<char>('a' + number));
    EXPECT_EQ(std::ranges::count(written, line), 100);
  }
}

TEST_F(FileLogSinkTest, APipeThatIsReadTakesLines) {
  const NamedPipe pipe(path);
  const auto sink = open();
  sink->write(kTime, 8, LogLevel::standard, "message");
  EXPECT_EQ(pipe.contents(), "2026-02-03T04:05:06.007089Z 8 default message\n");
}

TEST_F(FileLogSinkTest, APipeThatNobodyReadsIsAClearError) {
  makePipe(path);
  const auto opened = FileLogSink::open(path);
  ASSERT_FALSE(opened);
  EXPECT_EQ(opened.error(),
            (Error{std::string(domains::kPOSIX), ENXIO,
                   "cannot open log file \"" + path + "\": the pipe has no reader; start its reader first", nullptr}));
}

TEST_F(FileLogSinkTest, AFileThatCannotBeOpenedIsAClearError) {
  const auto opened = FileLogSink::open(folder.path("missing/sync.log"));
  ASSERT_FALSE(opened);
  EXPECT_EQ(opened.error(),
            Error::fromErrno(ENOENT, "cannot open log file \"" + folder.path("missing/sync.log") + "\""));
}

}  // namespace
}  // namespace appsync::test
