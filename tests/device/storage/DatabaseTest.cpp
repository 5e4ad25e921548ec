#include <cerrno>
#include <cstddef>
#include <optional>
#include <string>
#include <vector>

#include <gtest/gtest.h>
#include <sqlite3.h>
#include <sys/wait.h>
#include <unistd.h>

#include "device/storage/Database.h"
#include "device/storage/FaultPoint.h"
#include "kit/fakes/Threads.h"
#include "tests/support/ServiceDatabase.h"

namespace appsync::test {

using device::Database;
using device::Durability;
using device::Statement;

namespace {

struct Things {
  static constexpr const char* kSchema =
      "create table if not exists things (name text, size integer, extra blob, weight real);";
};

class DatabaseTest : public testing::Test {
 protected:
  std::int64_t count() {
    Database::Session session(database_);
    Statement query = session.prepare("select count(*) from things");
    return query.next() ? query.integer(0) : -1;
  }

  ServiceDatabase<Things> database_;
};

int failTheCommit(const char*) {
  static int calls = 0;
  return ++calls == 3 ? ENOSPC : 0;
}

int failTheBeginning(const char*) {
  device::setFaultHook(nullptr);
  return ENOSPC;
}

}  // namespace

TEST_F(DatabaseTest, StoresValuesOfEveryType) {
  const std::string bytes("a\0b", 3);
  {
    Database::Session session(database_);
    ASSERT_TRUE(
        session.run("insert into things values (?, ?, ?, ?)", "Zürich", std::int64_t{1} << 40, bytesOf(bytes), 2.5));
    ASSERT_TRUE(session.run("insert into things values (?, ?, ?, ?)", std::optional<std::string>(), nullptr,
                            std::optional<Bytes>(), nullptr));
    ASSERT_TRUE(
        session.run("insert into things values (?, ?, ?, ?)", std::string_view(), true, ByteView(), Durability::power));
    EXPECT_EQ(session.changes(), 1);
  }
  Database::Session session(database_);
  Statement query = session.prepare("select name, size, extra, weight from things order by rowid");
  ASSERT_TRUE(query.next());
  EXPECT_EQ(query.text(0), "Zürich");
  EXPECT_EQ(query.integer(1), std::int64_t{1} << 40);
  EXPECT_EQ(textOf(query.blob(2)), bytes);
  EXPECT_EQ(query.real(3), 2.5);
  ASSERT_TRUE(query.next());
  for (int column = 0; column < 4; ++column)
    EXPECT_TRUE(query.isNull(column));
  EXPECT_EQ(query.optionalText(0), std::nullopt);
  ASSERT_TRUE(query.next());
  EXPECT_EQ(query.optionalText(0), "");
  EXPECT_EQ(query.integer(1), 1);
  EXPECT_FALSE(query.isNull(2));
  EXPECT_EQ(query.integer(3), 1);
  EXPECT_FALSE(query.next());
  EXPECT_TRUE(query.status().ok());
}

TEST_F(DatabaseTest, ReportsInvalidStatements) {
  Database::Session session(database_);
  const Status status = session.run("insert into missing values (1)");
  ASSERT_FALSE(status.ok());
  EXPECT_EQ(status.error(), (Error{"SQLite", SQLITE_ERROR, "database: no such table: missing", nullptr}));
  Statement query = session.prepare("select ? from", 1);
  EXPECT_FALSE(query.next());
  EXPECT_FALSE(query.status().ok());
}

TEST_F(DatabaseTest, NestsOneStatement) {
  {
    Database::Session session(database_);
    for (int size = 0; size < 3; ++size)
      ASSERT_TRUE(session.run("insert into things (size) values (?)", size));
  }
  Database::Session session(database_);
  const std::string_view sql = "select size from things where size >= ? order by size";
  std::vector<std::int64_t> pairs;
  Statement outer = session.prepare(sql, 0);
  while (outer.next()) {
    Statement inner = session.prepare(sql, outer.integer(0));
    while (inner.next())
      pairs.push_back(outer.integer(0) * 10 + inner.integer(0));
  }
  EXPECT_EQ(pairs, (std::vector<std::int64_t>{0, 1, 2, 11, 12, 22}));
}

TEST_F(DatabaseTest, CommitsATransaction) {
  for (const Durability durability : {Durability::process, Durability::power}) {
    Database::Transaction transaction(database_, durability);
    transaction.run("insert into things (size) values (1)").ignore();
    transaction.run("insert into things (size) values (2)").ignore();
    EXPECT_TRUE(transaction.commit().ok());
  }
  EXPECT_EQ(count(), 4);
}

TEST_F(DatabaseTest, RollsBackWithoutCommit) {
  {
    Database::Transaction transaction(database_);
    transaction.run("insert into things (size) values (1)").ignore();
  }
  EXPECT_EQ(count(), 0);
}

TEST_F(DatabaseTest, RollsBackAfterFailedStatement) {
  {
    Database::Transaction transaction(database_);
    transaction.run("insert into things (size) values (1)").ignore();
    transaction.run("insert into missing values (1)").ignore();
    transaction.run("insert into things (size) values (2)").ignore();
    const Status committed = transaction.commit();
    ASSERT_FALSE(committed.ok());
    EXPECT_EQ(committed.error().text, "database: no such table: missing");
  }
  EXPECT_EQ(count(), 0);
}

TEST_F(DatabaseTest, SkipsStatementsAfterFailedBegin) {
  device::setFaultHook(failTheBeginning);
  {
    Database::Transaction transaction(database_);
    transaction.run("insert into things (size) values (1)").ignore();
    EXPECT_EQ(transaction.commit().error().code, ENOSPC);
  }
  EXPECT_EQ(count(), 0);
}

TEST_F(DatabaseTest, RollsBackAfterFailedCommit) {
  device::setFaultHook(failTheCommit);
  {
    Database::Transaction transaction(database_);
    transaction.run("insert into things (size) values (1)").ignore();
    EXPECT_EQ(transaction.commit().error().code, ENOSPC);
  }
  device::setFaultHook(nullptr);
  EXPECT_EQ(count(), 0);
}

TEST_F(DatabaseTest, IsThreadSafe) {
  runOnThreads(8, [&](std::size_t index) {
    for (int round = 0; round < 50; ++round) {
      Database::Transaction transaction(database_);
      transaction.run("insert into things (size) values (?)", index).ignore();
      EXPECT_TRUE(transaction.commit().ok());
    }
  });
  EXPECT_EQ(count(), 400);
}

TEST_F(DatabaseTest, CommitSurvivesCrash) {
  const pid_t child = fork();
  if (child == 0) {
    {
      Database::Transaction transaction(database_);
      transaction.run("insert into things (size) values (1)").ignore();
      if (!transaction.commit()) _exit(1);
    }
    Database::Transaction transaction(database_);
    transaction.run("insert into things (size) values (2)").ignore();
    _exit(0);
  }
  int status = 0;
  waitpid(child, &status, 0);
  EXPECT_EQ(status, 0);
  EXPECT_EQ(count(), 1);
}

TEST_F(DatabaseTest, ReadersSeeCommittedRows) {
  const auto reader = database_.openReadOnly();
  {
    Database::Session session(database_);
    ASSERT_TRUE(session.run("insert into things (size) values (1)"));
  }
  Database::Session session(*reader);
  Statement query = session.prepare("select count(*) from things");
  ASSERT_TRUE(query.next());
  EXPECT_EQ(query.integer(0), 1);
  const Status written = session.run("delete from things");
  EXPECT_EQ(device::systemErrorOf(written.error()), EROFS);
}

TEST(DatabaseErrors, MapToSystemErrors) {
  const auto meaning = [](long code) { return device::systemErrorOf(Error{"SQLite", code, "text", nullptr}); };
  EXPECT_EQ(meaning(SQLITE_FULL), ENOSPC);
  EXPECT_EQ(meaning(SQLITE_READONLY_DBMOVED), EROFS);
  EXPECT_EQ(meaning(SQLITE_BUSY_SNAPSHOT), EBUSY);
  EXPECT_EQ(meaning(SQLITE_IOERR_FSYNC), EIO);
  EXPECT_EQ(device::systemErrorOf(Error::fromErrno(EPIPE)), EPIPE);
  const Error system = device::asSystemError(Error{"SQLite", SQLITE_FULL, "full", nullptr});
  EXPECT_EQ(system, (Error{"POSIX", ENOSPC, "full", nullptr}));
  ASSERT_NE(system.underlying, nullptr);
  EXPECT_EQ(system.underlying->code, SQLITE_FULL);
}

}  // namespace appsync::test
