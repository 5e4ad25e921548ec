#include <chrono>
#include <optional>
#include <string>
#include <thread>
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
using platform::TransactionParty;
using platform::TransactionPhase;
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

TEST_F(TransactionLogTest, IsEmptyAtFirst) {
  EXPECT_TRUE(entries().empty());
}

TEST_F(TransactionLogTest, KeepsAllOfAStep) {
  log.initializeWithLog(SystemLog().createHandle("com.corvel.appinstallation", "zeph.appsync"));
  log.logStep(TransactionStep::createPlaceholder, TransactionParty::syncClient, TransactionPhase::end, true, "com.a",
              "done");
  const auto kept = entries();
  ASSERT_EQ(kept.size(), 1U);
  EXPECT_EQ(kept[0].subsystem, "com.corvel.appinstallation");
  EXPECT_EQ(kept[0].category, "zeph.appsync");
  EXPECT_EQ(kept[0].step, 4U);
  EXPECT_EQ(kept[0].scenario, std::nullopt);
  EXPECT_EQ(kept[0].party, TransactionParty::syncClient);
  EXPECT_EQ(kept[0].phase, TransactionPhase::end);
  EXPECT_TRUE(kept[0].success);
  EXPECT_EQ(kept[0].bundleIdentifier, "com.a");
  EXPECT_EQ(kept[0].description, "done");
}

TEST_F(TransactionLogTest, KeepsAllOfAScenario) {
  log.initializeWithLog(SystemLog().createHandle("s", "c"));
  log.logScenario("Harvo Sync", 0, false, "com.a", "Uninstall failed");
  const auto kept = entries();
  ASSERT_EQ(kept.size(), 1U);
  EXPECT_EQ(kept[0].scenario, "Harvo Sync");
  EXPECT_EQ(kept[0].step, 0U);
  EXPECT_EQ(kept[0].party, std::nullopt);
  EXPECT_EQ(kept[0].phase, std::nullopt);
  EXPECT_FALSE(kept[0].success);
  EXPECT_EQ(kept[0].bundleIdentifier, "com.a");
  EXPECT_EQ(kept[0].description, "Uninstall failed");
}

TEST_F(TransactionLogTest, EntriesCarryTheTimeAtWhichTheyWereMade) {
  const auto before = std::chrono::floor<std::chrono::microseconds>(std::chrono::system_clock::now());
  log.logScenario("s", 0, true, "com.a", "d");
  const auto after = std::chrono::system_clock::now();
  EXPECT_GE(entries().at(0).time, before);
  EXPECT_LE(entries().at(0).time, after);
}

TEST_F(TransactionLogTest, EntriesAreInTheOrderOfTheCalls) {
  for (int number = 0; number < 50; ++number)
    log.logScenario("s", 0, true, "com.a", std::to_string(number));
  const auto kept = entries();
  ASSERT_EQ(kept.size(), 50U);
  for (int number = 0; number < 50; ++number) {
    EXPECT_EQ(kept[static_cast<std::size_t>(number)].description, std::to_string(number));
  }
}

TEST_F(TransactionLogTest, EntriesAreMarkedWithTheLatestHandle) {
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

TEST_F(TransactionLogTest, KeepsTheHandleUntilItIsReplaced) {
  auto handle = SystemLog().createHandle("s", "c");
  const std::weak_ptr<platform::SystemLogHandle> watched = handle;
  log.initializeWithLog(std::move(handle));
  EXPECT_FALSE(watched.expired());
  log.initializeWithLog(SystemLog().createHandle("s", "d"));
  EXPECT_TRUE(watched.expired());
}

TEST_F(TransactionLogTest, TextsAreKeptByteForByte) {
  const std::string odd("a\0b'\";--\xff\n", 11);
  log.logScenario(odd, 0, true, odd, odd);
  const auto kept = entries();
  ASSERT_EQ(kept.size(), 1U);
  EXPECT_EQ(kept[0].scenario, odd);
  EXPECT_EQ(kept[0].bundleIdentifier, odd);
  EXPECT_EQ(kept[0].description, odd);
}

TEST_F(TransactionLogTest, EntriesOfManyThreadsAreAllKeptEachThreadsInOrder) {
  std::vector<std::thread> threads;
  for (int number = 0; number < 4; ++number) {
    threads.emplace_back([&, identifier = std::to_string(number)] {
      for (int entry = 0; entry < 25; ++entry)
        log.logScenario("s", 0, true, identifier, std::to_string(entry));
    });
  }
  for (std::thread& thread : threads)
    thread.join();
  std::vector<int> next(4, 0);
  for (const TransactionEntry& entry : entries()) {
    EXPECT_EQ(entry.description, std::to_string(next[static_cast<std::size_t>(std::stoi(entry.bundleIdentifier))]++));
  }
  EXPECT_EQ(next, std::vector(4, 25));
}

TEST_F(TransactionLogTest, IsReadBesideTheProcessThatWritesIt) {
  const auto reader = database.openReadOnly();
  TransactionLog readersLog(*reader);
  log.logScenario("s", 0, true, "com.a", "d");
  EXPECT_EQ(entriesOf(readersLog).size(), 1U);
  readersLog.logScenario("s", 0, true, "com.a", "lost");
  EXPECT_EQ(entriesOf(readersLog).size(), 1U);
}

TEST_F(TransactionLogTest, EntriesSurviveAKillOfTheirProcess) {
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

TEST_F(TransactionLogTest, WhatCannotBeKeptIsLostInSilence) {
  database.drop("transaction_log");
  log.logScenario("s", 0, true, "com.a", "d");
  EXPECT_FALSE(log.entries());
}

TEST_F(TransactionLogTest, EveryStepHasAName) {
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
