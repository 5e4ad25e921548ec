// A database for services that are tested without a whole device.
#pragma once

#include <memory>
#include <string>
#include <utility>

#include <gtest/gtest.h>

#include "device/storage/Database.h"
#include "kit/fakes/TemporaryFolder.h"

namespace appsync::test {

/// A database of its own, with the tables of `Services`.
template <class... Services>
class ServiceDatabase {
 public:
  ServiceDatabase() : database_(open(device::Access::exclusive)) { makeTables(); }

  operator device::Database&() { return *database_; }

  /// Another connection, as the next process has that changes the device.
  [[nodiscard]] std::unique_ptr<device::Database> openExclusive() { return open(device::Access::exclusive); }
  /// Another connection, as a process has that only looks.
  [[nodiscard]] std::unique_ptr<device::Database> openReadOnly() { return open(device::Access::readOnly); }

  /// Closes and opens it again, as the next process does.
  void reopen() {
    database_.reset();
    database_ = open(device::Access::exclusive);
    makeTables();
  }

  /// Takes a table away: whoever uses it fails from now on.
  void drop(const std::string& table) {
    device::Database::Session session(*database_);
    EXPECT_TRUE(session.runScript(("drop table " + table).c_str()));
  }

 private:
  [[nodiscard]] std::unique_ptr<device::Database> open(device::Access access) {
    auto opened = device::Database::open(folder_.path("device.db"), access);
    EXPECT_TRUE(opened);
    return std::move(opened).value();
  }

  void makeTables() {
    device::Database::Session session(*database_);
    for (const char* schema : {Services::kSchema...})
      EXPECT_TRUE(session.runScript(schema));
  }

  TemporaryFolder folder_;
  std::unique_ptr<device::Database> database_;
};

}  // namespace appsync::test
