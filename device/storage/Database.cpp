#include "device/storage/Database.h"

#include <algorithm>
#include <array>
#include <cassert>
#include <cerrno>
#include <utility>

#include <sqlite3.h>

#include "base/ReturnIfError.h"
#include "device/storage/FaultPoint.h"

namespace appsync::device {

namespace {

/// Longer than any transaction. Only a reader that recovers the log ever blocks others.
constexpr int kBusyMilliseconds = 10'000;

Error databaseError(sqlite3* connection, int code) {
  std::string text = "database: ";
  // sqlite3_errmsg describes the connection's last failure, which may be a different one.
  const bool own = connection != nullptr && sqlite3_extended_errcode(connection) == code;
  text += own ? sqlite3_errmsg(connection) : sqlite3_errstr(code);
  return {std::string(kSQLiteDomain), code, std::move(text), nullptr};
}

/// Runs statements without parameters.
Status execute(sqlite3* connection, const char* sql) {
  const int result = sqlite3_exec(connection, sql, nullptr, nullptr, nullptr);
  if (result == SQLITE_OK) return {};
  return databaseError(connection, sqlite3_extended_errcode(connection));
}

/// Returns the error that a fault hook injects, or nullopt.
std::optional<Error> injectedFailure(const char* name) {
  const int error = faultPoint(name);
  if (error == 0) return std::nullopt;
  return Error::fromErrno(error, "database");
}

// With the write-ahead log, "normal" commits without waiting for the disk. The file is never torn and survives crashes;
// a power failure may roll back the last few transactions, whole and in order. Waiting for the disk at each commit
// would cost more than unpacking a package; transactions that need it pass Durability::power. The log is kept when the
// last connection closes, because read-only connections cannot create it.
constexpr const char* kWriterSettings =
    "pragma journal_mode = wal; pragma synchronous = normal; pragma foreign_keys = on;";

Status configure(sqlite3* connection, Access access) {
  sqlite3_extended_result_codes(connection, 1);
  sqlite3_busy_timeout(connection, kBusyMilliseconds);
  if (access == Access::readOnly) return {};
  int keepLog = 1;
  sqlite3_file_control(connection, "main", SQLITE_FCNTL_PERSIST_WAL, &keepLog);
  return execute(connection, kWriterSettings);
}

/// Returns the low byte of an extended result code.
long primaryCodeOf(const Error& error) {
  constexpr long kPrimary = 0xFF;
  return error.code & kPrimary;
}

}  // namespace

Result<std::unique_ptr<Database>> Database::open(const std::string& path, Access access) {
  const int mode = access == Access::readOnly ? SQLITE_OPEN_READONLY : SQLITE_OPEN_READWRITE | SQLITE_OPEN_CREATE;
  sqlite3* connection = nullptr;
  // SQLite could parse a relative path as a URI.
  const std::string file = path.starts_with('/') ? path : "./" + path;
  // `turn_` already serializes the threads.
  const int result = sqlite3_open_v2(file.c_str(), &connection, mode | SQLITE_OPEN_NOMUTEX, nullptr);
  std::unique_ptr<Database> database(new Database(connection));
  if (result != SQLITE_OK) return databaseError(connection, result);
  RETURN_IF_ERROR(configure(connection, access));
  return database;
}

Database::~Database() {
  for (auto& [sql, prepared] : prepared_) {
    assert(!prepared.busy);
    sqlite3_finalize(prepared.statement);
  }
  sqlite3_close(connection_);
}

Statement::Statement(Database& database, std::string_view sql) : connection_(database.connection_) {
  const auto found = database.prepared_.find(sql);
  Database::Prepared& kept = found != database.prepared_.end() ? found->second : database.prepared_[std::string(sql)];
  sqlite3_stmt*& statement = kept.busy ? statement_ : kept.statement;
  if (statement == nullptr) {
    check(sqlite3_prepare_v3(connection_, sql.data(), static_cast<int>(sql.size()), SQLITE_PREPARE_PERSISTENT,
                             &statement, nullptr));
  }
  if (kept.busy) return;  // An outer statement of this thread uses the cached one; this object owns a second one.
  kept.busy = true;
  home_ = &kept;
  statement_ = kept.statement;
}

Statement::Statement(Statement&& other) noexcept
    : connection_(other.connection_),
      statement_(std::exchange(other.statement_, nullptr)),
      home_(std::exchange(other.home_, nullptr)),
      status_(std::move(other.status_)) {}

Statement::~Statement() {
  if (home_ == nullptr) {
    sqlite3_finalize(statement_);
    return;
  }
  sqlite3_reset(statement_);
  if (statement_ != nullptr) sqlite3_clear_bindings(statement_);  // Unlike sqlite3_reset, it rejects null.
  home_->busy = false;
}

bool Statement::next() {
  if (!status_) return false;
  const int result = sqlite3_step(statement_);
  if (result == SQLITE_ROW) return true;
  if (result != SQLITE_DONE) check(result);
  return false;
}

void Statement::check(int result) {
  if (result != SQLITE_OK && status_) status_ = databaseError(connection_, result);
}

bool Statement::isNull(int column) const {
  return sqlite3_column_type(statement_, column) == SQLITE_NULL;
}
std::int64_t Statement::integer(int column) const {
  return sqlite3_column_int64(statement_, column);
}
double Statement::real(int column) const {
  return sqlite3_column_double(statement_, column);
}

std::string_view Statement::text(int column) const {
  const unsigned char* text = sqlite3_column_text(statement_, column);
  if (text == nullptr) return {};
  return {reinterpret_cast<const char*>(text), static_cast<std::size_t>(sqlite3_column_bytes(statement_, column))};
}

ByteView Statement::blob(int column) const {
  const void* bytes = sqlite3_column_blob(statement_, column);
  if (bytes == nullptr) return {};
  return {static_cast<const std::byte*>(bytes), static_cast<std::size_t>(sqlite3_column_bytes(statement_, column))};
}

std::optional<std::string> Statement::optionalText(int column) const {
  if (isNull(column)) return std::nullopt;
  return std::string(text(column));
}

// A statement that could not be prepared is null. Binding to it fails too, but `status_` keeps the first failure.

void Statement::bind(int index, std::nullptr_t) {
  check(sqlite3_bind_null(statement_, index));
}
void Statement::bind(int index, std::int64_t value) {
  check(sqlite3_bind_int64(statement_, index, value));
}
void Statement::bind(int index, double value) {
  check(sqlite3_bind_double(statement_, index, value));
}

void Statement::bind(int index, std::string_view value) {
  const char* text = value.data() == nullptr ? "" : value.data();  // A null pointer would bind a SQL null.
  check(sqlite3_bind_text64(statement_, index, text, value.size(), SQLITE_TRANSIENT, SQLITE_UTF8));
}

void Statement::bind(int index, ByteView value) {
  check(value.empty() ? sqlite3_bind_zeroblob(statement_, index, 0)
                      : sqlite3_bind_blob64(statement_, index, value.data(), value.size(), SQLITE_TRANSIENT));
}

Status Database::Session::finish(Statement& statement) {
  if (allOrNothing_ && !failure_) return failure_;
  if (auto failure = injectedFailure("database statement")) {
    if (failure_) failure_ = *failure;
    return *failure;
  }
  while (statement.next()) {
  }
  if (!statement.status() && failure_) failure_ = statement.status();
  return statement.status();
}

Status Database::Session::runScript(const char* sql) {
  if (allOrNothing_ && !failure_) return failure_;
  Status done;
  if (auto failure = injectedFailure("database script")) {
    done = *failure;
  } else {
    done = execute(database_.connection_, sql);
  }
  if (!done && failure_) failure_ = done;
  return done;
}

std::int64_t Database::Session::changes() const {
  return sqlite3_changes64(database_.connection_);
}

Database::Transaction::Transaction(Database& database, Durability durability)
    : Session(database), durability_(durability) {
  if (durability_ == Durability::power) execute(database_.connection_, "pragma synchronous = full").ignore();
  failure_ = run("begin immediate");
  open_ = failure_.ok();
  allOrNothing_ = true;
}

Database::Transaction::~Transaction() {
  if (open_ && sqlite3_get_autocommit(database_.connection_) == 0) execute(database_.connection_, "rollback").ignore();
  if (durability_ == Durability::power) execute(database_.connection_, "pragma synchronous = normal").ignore();
}

Status Database::Transaction::commit() {
  if (!failure_) return failure_;
  if (durability_ == Durability::power) {
    if (auto failure = injectedFailure("database to disk")) return *failure;
  }
  RETURN_IF_ERROR(run("commit"));
  open_ = false;
  return {};
}

int systemErrorOf(const Error& error) {
  if (error.domain == domains::kPOSIX) return static_cast<int>(error.code);
  constexpr std::array<std::pair<int, int>, 7> kMeanings{{
      {SQLITE_FULL, ENOSPC},
      {SQLITE_READONLY, EROFS},
      {SQLITE_PERM, EACCES},
      {SQLITE_CANTOPEN, EACCES},
      {SQLITE_NOMEM, ENOMEM},
      {SQLITE_BUSY, EBUSY},
      {SQLITE_LOCKED, EBUSY},
  }};
  const auto found = std::ranges::find(kMeanings, static_cast<int>(primaryCodeOf(error)), &std::pair<int, int>::first);
  return error.domain != kSQLiteDomain || found == kMeanings.end() ? EIO : found->second;
}

Error asSystemError(Error error) {
  if (error.domain != kSQLiteDomain) return error;
  Error system{std::string(domains::kPOSIX), systemErrorOf(error), error.text, nullptr};
  system.underlying = std::make_shared<const Error>(std::move(error));
  return system;
}

Status asSystemError(Status status) {
  return status ? std::move(status) : Status(asSystemError(status.error()));
}

bool isDatabaseDamage(const Error& error) {
  return error.domain == kSQLiteDomain &&
         (primaryCodeOf(error) == SQLITE_CORRUPT || primaryCodeOf(error) == SQLITE_NOTADB);
}

}  // namespace appsync::device
