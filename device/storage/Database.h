// The device's database: a thread-safe layer over SQLite.
#pragma once

#include <concepts>
#include <cstdint>
#include <map>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>
#include <type_traits>

#include "base/Bytes.h"
#include "base/Error.h"
#include "device/storage/Access.h"
#include "device/storage/Durability.h"

struct sqlite3;
struct sqlite3_stmt;

namespace appsync::device {

/// Error domain of the database; codes are SQLite's extended result codes.
inline constexpr std::string_view kSQLiteDomain = "SQLite";

/// One connection, used by one thread at a time. Thread-safe. The write-ahead log keeps readers in other processes from
/// blocking and being blocked.
///
///     Database::Session session(database);
///     Statement query = session.prepare("select name, size from things where kind = ?", kind);
///     while (query.next()) use(query.text(0), query.integer(1));
///     if (!query.status()) return query.status();
///
///     Database::Transaction transaction(database);
///     transaction.run("insert into things values (?, ?, ?)", name, kind, size).ignore();
///     return transaction.commit();
///
/// A thread may have one session or transaction at a time; opening a second one is a deadlock. Every service creates
/// its own tables: a `static constexpr const char* kSchema` of "create table if not exists …" statements, listed in
/// `Services.h`.
class Database {
 public:
  class Session;
  class Transaction;

  /// Opens the database at a host path. `exclusive` creates a missing file but does not lock it: callers ensure that
  /// one process writes.
  [[nodiscard]] static Result<std::unique_ptr<Database>> open(const std::string& path, Access access);
  ~Database();
  Database(const Database&) = delete;
  Database& operator=(const Database&) = delete;

 private:
  friend class Statement;

  /// A cached prepared statement.
  struct Prepared {
    sqlite3_stmt* statement = nullptr;
    bool busy = false;
  };

  explicit Database(sqlite3* connection) : connection_(connection) {}

  std::mutex turn_;
  // Under turn_:
  sqlite3* connection_;
  std::map<std::string, Prepared, std::less<>> prepared_;
};

/// A statement with bound parameters. Must not outlive its session. After the first failure `next` always returns
/// false.
class Statement {
 public:
  Statement(Statement&& other) noexcept;
  Statement& operator=(Statement&&) = delete;
  ~Statement();

  /// Moves to the next row. Returns false at the end and on failure.
  [[nodiscard]] bool next();
  /// The first failure.
  [[nodiscard]] const Status& status() const noexcept { return status_; }

  // Columns of the current row, from 0. Views are valid until the next call of `next`. SQLite converts other types; a
  // null is empty or 0.
  [[nodiscard]] bool isNull(int column) const;
  [[nodiscard]] std::int64_t integer(int column) const;
  [[nodiscard]] double real(int column) const;
  [[nodiscard]] std::string_view text(int column) const;
  [[nodiscard]] ByteView blob(int column) const;
  [[nodiscard]] std::optional<std::string> optionalText(int column) const;

 private:
  friend class Database::Session;

  Statement(Database& database, std::string_view sql);

  void bind(int index, std::nullptr_t);
  void bind(int index, std::int64_t value);
  void bind(int index, double value);
  void bind(int index, std::string_view value);
  void bind(int index, ByteView value);
  template <std::integral T>
  void bind(int index, T value) {
    bind(index, static_cast<std::int64_t>(value));
  }
  template <class T>
  requires std::is_enum_v<T>
  void bind(int index, T value) { bind(index, static_cast<std::int64_t>(value)); }
  template <class T>
  requires std::convertible_to<const T&, std::string_view>
  void bind(int index, const T& value) { bind(index, static_cast<std::string_view>(value)); }
  template <class T>
  void bind(int index, const std::optional<T>& value) {
    value ? bind(index, *value) : bind(index, nullptr);
  }
  void bind(int index, const Bytes& value) { bind(index, ByteView(value)); }

  void check(int result);

  sqlite3* connection_;
  sqlite3_stmt* statement_ = nullptr;
  /// The cache entry to release, or null if this object owns the statement.
  Database::Prepared* home_ = nullptr;
  Status status_;
};

/// Exclusive use of the connection. Outside a transaction each statement is committed by itself.
class Database::Session {
 public:
  explicit Session(Database& database) : database_(database), lock_(database.turn_) {}

  /// Binds `arguments` (integers, enumerations, reals, texts, bytes, optionals of these, nullptr) to the "?" in order.
  /// The arguments are copied. On failure the statement's status is an error.
  template <class... Arguments>
  [[nodiscard]] Statement prepare(std::string_view sql, const Arguments&... arguments) {
    Statement statement(database_, sql);
    int index = 0;
    (statement.bind(++index, arguments), ...);
    return statement;
  }

  /// Runs a statement to its end.
  template <class... Arguments>
  Status run(std::string_view sql, const Arguments&... arguments) {
    Statement statement = prepare(sql, arguments...);
    return finish(statement);
  }

  /// Runs several statements without parameters, separated by semicolons, without caching them.
  Status runScript(const char* sql);

  /// Returns the number of rows that the last insert, update or delete changed.
  [[nodiscard]] std::int64_t changes() const;

 protected:
  Status finish(Statement& statement);

  Database& database_;
  std::unique_lock<std::mutex> lock_;
  /// The first statement that failed.
  Status failure_;
  /// Whether statements after a failed one are skipped.
  bool allOrNothing_ = false;
};

/// A transaction. The destructor rolls back unless `commit` succeeded.
class Database::Transaction : public Database::Session {
 public:
  explicit Transaction(Database& database, Durability durability = Durability::process);
  ~Transaction();

  /// Fails with the error of the first `run` that failed, if any; the transaction is then rolled back.
  [[nodiscard]] Status commit();

 private:
  Durability durability_;
  bool open_ = false;
};

/// Returns the errno value that matches a database or system error, or EIO if there is no match.
[[nodiscard]] int systemErrorOf(const Error& error);

/// Returns a database error as a "POSIX" error with the former as its underlying error; others are returned unchanged.
[[nodiscard]] Error asSystemError(Error error);
[[nodiscard]] Status asSystemError(Status status);

/// Returns whether the error means that the file is damaged or not a database.
[[nodiscard]] bool isDatabaseDamage(const Error& error);

}  // namespace appsync::device
