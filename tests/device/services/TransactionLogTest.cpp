#include <chrono>
#include <optional>
#include <string>
#include <vector>

#include <gtest/gtest.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include "device/services/TransactionLog.h"
#include "tests/support/ServiceDatabase.h"

namespace appsync::test {
namespace {

using device::nameOf;
using device::SystemLog;
using device::TransactionEntry;
using device::TransactionLog;
using platform::TransactionStep;

class TransactionLogTest : public testing::Test {
 protected:
  std::vector<TransactionEntry> entries() { return entriesOf(log); }
  static std::vector<TransactionEntry> entriesOf(TransactionLog& log) {
    auto entries = log.entries();
    EXPECT_TRUE(entries);
    return std::move(entries).value();
  }

  ServiceDatabase<TransactionLog> database;
  TransactionLog log{database};
};

TEST_F(TransactionLogTest, IsEmptyInitially) {
  EXPECT_TRUE(entries().empty());
}

TEST_F(TransactionLogTest, EntriesHaveTimeOfCall) {
  const auto before = std::chrono::floor<std::chrono::microseconds>(std::chrono::system_clock::now());
  log.logScenario("s", 0, true, "com.a", "d");
  const auto after = std::chrono::system_clock::now();
  EXPECT_GE(entries().at(0).time, before);
  EXPECT_LE(entries().at(0).time, after);
}

TEST_F(TransactionLogTest, EntriesHaveLatestHandle) {
  log.logScenario("s", 0, true, "com.a", "unmarked");
  log.initializeWithLog(SystemLog().createHandle("first", "1"));
  log.logScenario("s", 0, true, "com.a", "marked");
  log.initializeWithLog(SystemLog().createHandle("second", "2"));
  log.logScenario("s", 0, true, "com.a", "marked anew");
  const auto kept = entries();
  ASSERT_EQ(kept.size(), 3U);
  EXPECT_EQ(kept[0].subsystem + "/" + kept[0].category, "/");
  EXPECT_EQ(kept[1].subsystem + "/" + kept[1].category, "first/1");
  EXPECT_EQ(kept[2].subsystem + "/" + kept[2].category, "second/2");
}

TEST_F(TransactionLogTest, OwnsHandleUntilReplaced) {
  auto handle = SystemLog().createHandle("s", "c");
  const std::weak_ptr<platform::SystemLogHandle> watched = handle;
  log.initializeWithLog(std::move(handle));
  EXPECT_FALSE(watched.expired());
  log.initializeWithLog(SystemLog().createHandle("s", "d"));
  EXPECT_TRUE(watched.expired());
}

TEST_F(TransactionLogTest, StoresTextsByteForByte) {
  const std::string odd("a\0b'\";--\xff\n", 11);
  log.logScenario(odd, 0, true, odd, odd);
  const auto kept = entries();
  ASSERT_EQ(kept.size(), 1U);
  EXPECT_EQ(kept[0].scenario, odd);
  EXPECT_EQ(kept[0].bundleIdentifier, odd);
  EXPECT_EQ(kept[0].description, odd);
}

TEST_F(TransactionLogTest, ReadersSeeEntriesOfWriter) {
  const auto reader = database.openReadOnly();
  TransactionLog readersLog(*reader);
  log.logScenario("s", 0, true, "com.a", "d");
  EXPECT_EQ(entriesOf(readersLog).size(), 1U);
  readersLog.logScenario("s", 0, true, "com.a", "lost");
  EXPECT_EQ(entriesOf(readersLog).size(), 1U);
}

TEST_F(TransactionLogTest, EntriesSurviveCrash) {
  const pid_t child = fork();
  if (child == 0) {
    const auto own = database.openExclusive();
    TransactionLog childsLog(*own);
    childsLog.logScenario("s", 0, true, "com.a", "last words");
    kill(getpid(), SIGKILL);
  }
  int status = 0;
  ASSERT_EQ(waitpid(child, &status, 0), child);
  ASSERT_TRUE(WIFSIGNALED(status));
  database.reopen();
  TransactionLog reopened(database);
  const auto kept = entriesOf(reopened);
  ASSERT_EQ(kept.size(), 1U);
  EXPECT_EQ(kept[0].description, "last words");
}

TEST_F(TransactionLogTest, IgnoresEntriesThatCannotBeStored) {
  database.drop("transaction_log");
  log.logScenario("s", 0, true, "com.a", "d");
  EXPECT_FALSE(log.entries());
}

TEST_F(TransactionLogTest, NamesEveryStep) {
  EXPECT_EQ(nameOf(TransactionStep::installApp), "install app");
  EXPECT_EQ(nameOf(TransactionStep::restoreApp), "restore app");
  EXPECT_EQ(nameOf(TransactionStep::createCoordinator), "create coordinator");
  EXPECT_EQ(nameOf(TransactionStep::createPlaceholder), "create placeholder");
  EXPECT_EQ(nameOf(TransactionStep::copyIcon), "copy icon");
  EXPECT_EQ(nameOf(TransactionStep::uninstallApp), "uninstall app");
  EXPECT_EQ(nameOf(TransactionStep{99}), "unknown step");
}

}  // namespace
}  // namespace appsync::test
